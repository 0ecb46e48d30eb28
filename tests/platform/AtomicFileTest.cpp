#include "platform/host/AtomicFile.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <thread>

#include "platform/host/JsonLines.h"
#include "support/TemporaryFolder.h"

namespace vesprun {
namespace {

using ::testing::ElementsAre;
using ::testing::HasSubstr;
using ::testing::IsEmpty;

mode_t modeOf(const std::string& path) {
  struct stat status {};
  EXPECT_EQ(stat(path.c_str(), &status), 0) << path;
  return status.st_mode & 07777;
}

/// Lets no file of this process grow beyond a size, as a full disk would.
class FileSizeLimit {
 public:
  explicit FileSizeLimit(rlim_t bytes) : _handler(signal(SIGXFSZ, SIG_IGN)) {
    getrlimit(RLIMIT_FSIZE, &_before);
    const rlimit limited{bytes, _before.rlim_max};
    setrlimit(RLIMIT_FSIZE, &limited);
  }
  ~FileSizeLimit() {
    setrlimit(RLIMIT_FSIZE, &_before);
    signal(SIGXFSZ, _handler);
  }

 private:
  rlimit _before{};
  sighandler_t _handler;
};

TEST(AtomicFile, showsTheDocumentOnlyWhenItIsComplete) {
  const TemporaryFolder folder;
  std::string error;
  const std::string large(200'000, 'x');
  for (const std::string& content : {large, std::string("second")}) {
    const auto before = folder.names();
    std::optional<AtomicFile> file = AtomicFile::create(folder.path(), error);
    ASSERT_TRUE(file) << error;
    EXPECT_TRUE(file->append(content));
    EXPECT_TRUE(file->append("!"));
    EXPECT_EQ(folder.names(), before);
    ASSERT_TRUE(file->replace("document", error)) << error;
    EXPECT_THAT(folder.names(), ElementsAre("document"));
    EXPECT_EQ(folder.read("document"), content + "!");
    EXPECT_EQ(modeOf(folder.path("document")), 0600U);
  }
}

TEST(AtomicFile, leavesNothingWhenItIsDropped) {
  const TemporaryFolder folder;
  std::string error;
  { AtomicFile::create(folder.path(), error)->append("half"); }
  EXPECT_THAT(folder.names(), IsEmpty());
}

TEST(AtomicFile, addsOnlyUnderANameThatIsFree) {
  const TemporaryFolder folder;
  folder.write("0001", "earlier");
  std::string error;
  std::optional<AtomicFile> file = AtomicFile::create(folder.path(), error);
  file->append("new");
  EXPECT_EQ(file->addNew("0001", error), AtomicFile::Added::NameTaken);
  EXPECT_EQ(error, "");
  EXPECT_EQ(file->addNew("0002", error), AtomicFile::Added::Done);
  EXPECT_EQ(file->addNew("missing/0003", error), AtomicFile::Added::Failed);
  EXPECT_THAT(error, HasSubstr("missing/0003: No such file"));
  EXPECT_EQ(folder.read("0001"), "earlier");
  EXPECT_EQ(folder.read("0002"), "new");
}

TEST(AtomicFile, keepsTheEarlierDocumentWhenTheDiskIsFull) {
  const TemporaryFolder folder;
  folder.write("document", "earlier");
  std::string error;
  {
    const FileSizeLimit limit(100'000);
    EXPECT_FALSE(replaceFile(folder.path("document"), std::string(150'000, 'x'), error));
  }
  EXPECT_THAT(error, HasSubstr(folder.path("document") + ": File too large"));
  EXPECT_EQ(folder.read("document"), "earlier");
  EXPECT_THAT(folder.names(), ElementsAre("document"));
}

TEST(AtomicFile, replacesThroughWhatAKilledProcessLeft) {
  const TemporaryFolder folder;
  folder.write("document", "earlier");
  folder.write(".replacement", "complete, but never renamed");
  std::string error;
  EXPECT_TRUE(replaceFile(folder.path("document"), "new", error)) << error;
  EXPECT_EQ(folder.read("document"), "new");
  EXPECT_THAT(folder.names(), ElementsAre("document"));
}

TEST(AtomicFile, isCompleteOrAbsentWhereverItsWriterIsKilled) {
  const TemporaryFolder folder;
  const std::string content(300'000, 'x');
  for (int delay = 0; delay < 20; ++delay) {
    const pid_t child = fork();
    ASSERT_GE(child, 0);
    if (child == 0) {
      std::string error;
      while (replaceFile(folder.path("document"), content, error)) {
      }
      _exit(1);
    }
    usleep(static_cast<useconds_t>(delay * 700));
    kill(child, SIGKILL);
    int status = 0;
    waitpid(child, &status, 0);
    ASSERT_TRUE(WIFSIGNALED(status));
    for (const std::string& name : folder.names()) {
      EXPECT_EQ(folder.read(name).size(), content.size()) << name;
    }
  }
  EXPECT_THAT(folder.names(), ::testing::Contains("document"));
}

TEST(AtomicFile, namesAFolderThatIsMissing) {
  const TemporaryFolder folder;
  std::string error;
  EXPECT_FALSE(AtomicFile::create(folder.path("none"), error));
  EXPECT_EQ(error, folder.path("none") + ": No such file or directory");
}

TEST(JsonLines, appendsWholeLinesFromManyWriters) {
  const TemporaryFolder folder;
  JsonLines first(folder.path("events.jsonl"));
  JsonLines second(folder.path("events.jsonl"));
  const std::string line(500, 'x');
  const auto write = [&line](JsonLines& lines) {
    std::string error;
    for (int count = 0; count < 200; ++count) {
      EXPECT_TRUE(lines.append(line, error)) << error;
    }
  };
  std::thread shared(write, std::ref(first));
  std::thread other(write, std::ref(second));
  write(first);
  shared.join();
  other.join();
  std::string expected;
  for (int count = 0; count < 600; ++count) {
    expected += line + '\n';
  }
  EXPECT_EQ(folder.read("events.jsonl"), expected);
  EXPECT_EQ(modeOf(folder.path("events.jsonl")), 0600U);
}

TEST(JsonLines, endsATornLineAndMakesADeletedFileAnew) {
  const TemporaryFolder folder;
  folder.write("log.jsonl", "{\"whole\":1}\n{\"to");
  JsonLines lines(folder.path("log.jsonl"));
  std::string error;
  EXPECT_TRUE(lines.append("{}", error)) << error;
  EXPECT_EQ(folder.read("log.jsonl"), "{\"whole\":1}\n{\"to\n{}\n");
  EXPECT_FALSE(lines.append("two\nlines", error));
  unlink(folder.path("log.jsonl").c_str());
  EXPECT_TRUE(lines.append("{}", error)) << error;
  EXPECT_EQ(folder.read("log.jsonl"), "{}\n");
}

TEST(JsonLines, takesBackALineThatDidNotFit) {
  const TemporaryFolder folder;
  JsonLines lines(folder.path("log.jsonl"));
  std::string error;
  EXPECT_TRUE(lines.append("{}", error)) << error;
  {
    const FileSizeLimit limit(100);
    EXPECT_FALSE(lines.append(std::string(200, 'x'), error));
  }
  EXPECT_EQ(error, folder.path("log.jsonl") + ": no room for a line");
  EXPECT_EQ(folder.read("log.jsonl"), "{}\n");
  EXPECT_TRUE(lines.append("{}", error)) << error;
  EXPECT_EQ(folder.read("log.jsonl"), "{}\n{}\n");
}

}  // namespace
}  // namespace vesprun

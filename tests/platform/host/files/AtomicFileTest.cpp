#include "platform/host/files/AtomicFile.h"

#include <fcntl.h>
#include <linux/filter.h>
#include <linux/seccomp.h>
#include <sys/file.h>
#include <sys/prctl.h>
#include <sys/syscall.h>

#include <atomic>
#include <sstream>
#include <thread>

#include "platform/host/files/JsonLines.h"
#include "support/HostServiceTest.h"
#include "support/ScarceMemory.h"

namespace {

bool isRandomKnown = false;
bool foldersCannotBeFlushed = false;

}  // namespace

// In place of the C library's.
extern "C" int fsync(int file) {
  struct stat status {};
  if (foldersCannotBeFlushed && fstat(file, &status) == 0 && S_ISDIR(status.st_mode)) {
    errno = EIO;
    return -1;
  }
  return static_cast<int>(syscall(SYS_fsync, file));
}
extern "C" ssize_t getrandom(void* bytes, std::size_t size, unsigned flags) {
  if (!isRandomKnown) {
    return syscall(SYS_getrandom, bytes, size, flags);
  }
  memset(bytes, 1, size);
  return static_cast<ssize_t>(size);
}

namespace vesprun {
namespace {

using ::testing::ElementsAre, ::testing::HasSubstr;

using AtomicFileTest = HostServiceTest;
using JsonLinesTest = HostServiceTest;

TEST_F(AtomicFileTest, ShowsTheDocumentOnlyWhenItIsComplete) {
  const std::string large(200'000, 'x');
  std::string before = "earlier";
  folder.write("document", before);
  chmod(folder.path("document").c_str(), 0644);
  const mode_t mask = umask(0277);
  for (const std::string& content : {large, std::string("second")}) {
    std::optional<AtomicFile> file = AtomicFile::create(folder.path(), error);
    ASSERT_TRUE(file) << error;
    EXPECT_TRUE(file->append(content));
    EXPECT_TRUE(file->append("!"));
    EXPECT_EQ(folder.read("document"), before);
    ASSERT_TRUE(file->replace("document", error)) << error;
    before = content + "!";
    EXPECT_THAT(folder.names(), ElementsAre("document"));
    EXPECT_EQ(folder.read("document"), content + "!");
    EXPECT_EQ(modeOf("document"), mode_t{S_IFREG | 0600});
  }
  umask(mask);
}

TEST_F(AtomicFileTest, AddsOnlyUnderANameThatIsFree) {
  folder.write("0001", "earlier");
  std::optional<AtomicFile> file = AtomicFile::create(folder.path(), error);
  file->append("new");
  EXPECT_EQ(file->addNew("0001", error), AtomicFile::Added::NameTaken);
  EXPECT_EQ(error, "");
  EXPECT_EQ(file->addNew("0002", error), AtomicFile::Added::Done);
  EXPECT_EQ(file->addNew("missing/0003", error), AtomicFile::Added::Failed);
  EXPECT_THAT(error, HasSubstr("missing/0003: No such file"));
  EXPECT_EQ(folder.read("0001"), "earlier");
  EXPECT_EQ(folder.read("0002"), "new");
  AtomicFile::create(folder.path(), error)->append("dropped");
  EXPECT_THAT(folder.names(), ElementsAre("0001", "0002"));
  EXPECT_FALSE(AtomicFile::create(folder.path("none"), error));
  EXPECT_EQ(error, folder.path("none") + ": No such file or directory");
}

TEST_F(AtomicFileTest, RemovesItsOwnLeftOversAloneAndWaitsForNone) {
  ASSERT_EQ(mkfifo(folder.path(".unfinished-pipe").c_str(), 0600), 0);
  ASSERT_EQ(symlink("document", folder.path(".unfinished-link").c_str()), 0);
  folder.write(".unfinished-left", "by a process that was killed");
  folder.write(".unfinished-others", "");
  ASSERT_EQ(chown(folder.path(".unfinished-others").c_str(), 12345, 12345),
            geteuid() == 0 ? 0 : -1);
  {
    std::optional<AtomicFile> written = AtomicFile::create(folder.path(), error);
    ASSERT_TRUE(written) << error;
    EXPECT_TRUE(replaceFile(folder.path("document"), "new", error)) << error;
    EXPECT_EQ(written->addNew("written", error), AtomicFile::Added::Done) << error;
  }
  std::vector<std::string> names{".unfinished-link", ".unfinished-pipe", "document", "written"};
  if (geteuid() == 0) {
    names.insert(names.begin() + 1, ".unfinished-others");
  }
  EXPECT_EQ(folder.names(), names);
}

TEST_F(AtomicFileTest, OpensNothingThatWasThereBefore) {
  folder.write(".unfinished-0101010101010101", "by another user");
  isRandomKnown = true;
  EXPECT_FALSE(replaceFile(folder.path("document"), "new", error));
  isRandomKnown = false;
  EXPECT_EQ(folder.read(".unfinished-0101010101010101"), "by another user");
}

TEST_F(AtomicFileTest, FailsWhereANameIsNotDurable) {
  std::optional<AtomicFile> file = AtomicFile::create(folder.path(), error);
  foldersCannotBeFlushed = true;
  EXPECT_EQ(file->addNew("0001", error), AtomicFile::Added::Failed);
  EXPECT_FALSE(replaceFile(folder.path("document"), "new", error));
  EXPECT_FALSE(device.makeFolder("new", error));
  foldersCannotBeFlushed = false;
  EXPECT_EQ(error, folder.path("new") + ": Input/output error");
  EXPECT_THAT(folder.names(), ElementsAre("document", "new"));
}

TEST_F(AtomicFileTest, IsNotForAGroupThatItCannotBeGiven) {
  chmod(folder.path().c_str(), 0777);
  struct stat shared {};
  shared.st_mode = 0775;
  shared.st_uid = shared.st_gid = 12345;
  for (const bool isRoot : {geteuid() == 0, false}) {
    EXPECT_TRUE(hasSucceeded(startProcess([&] {
      EXPECT_TRUE(isRoot || geteuid() != 0 || setuid(65534) == 0);
      std::optional<AtomicFile> file = AtomicFile::create(folder.path(), error);
      file->takeAccessOf(shared);
      EXPECT_TRUE(file->replace("shared", error)) << error;
      EXPECT_EQ(modeOf("shared"), S_IFREG | (isRoot ? 0664U : 0604U));
    })));
  }
}

TEST_F(AtomicFileTest, FollowsLinksOnlyInWhatTheUserNamed) {
  folder.write("inside/file", "inside");
  ASSERT_EQ(symlink("inside", folder.path("link").c_str()), 0);
  ASSERT_EQ(symlink("file", folder.path("inside/link").c_str()), 0);
  EXPECT_EQ(readWholeFile(folder.path("link/link"), error), "inside");
  EXPECT_EQ(readWholeFile(HostPath(folder.path("link")).below("file"), error), "inside");
  for (const char* const path : {"link/file", "inside/link", "link"}) {
    const HostPath below = device.hostPath(path);
    EXPECT_FALSE(readWholeFile(below, error)) << path;
    EXPECT_EQ(error, below.string() + ": a symbolic link");
    EXPECT_FALSE(below.status());
    EXPECT_FALSE(openStepByStep(openFolder(folder.path()).get(), path, O_PATH, 0).isOpen());
    EXPECT_FALSE(openStepByStep(openFolder(folder.path()).get(), path, O_RDONLY, 0).isOpen());
  }
  EXPECT_TRUE(
      openStepByStep(openFolder(folder.path()).get(), "inside//file", O_RDONLY, 0).isOpen());
  EXPECT_FALSE(device.makeFolder("link/new", error));
  EXPECT_EQ(error, folder.path("link") + ": a symbolic link");
  EXPECT_FALSE(device.readOnly().makeFolder("new", error));
  EXPECT_FALSE(replaceFile(device.hostPath("link/new"), "", error));
  EXPECT_FALSE(removeFile(device.hostPath("link/file")));
  EXPECT_TRUE(replaceFile(device.hostPath("inside/link"), "replaced", error)) << error;
  EXPECT_EQ(folder.read("inside/file"), "inside");
  EXPECT_TRUE(hasSucceeded(startProcess([this] {
    // A sandbox that does not know the call.
    sock_filter steps[] = {BPF_STMT(BPF_LD | BPF_W | BPF_ABS, offsetof(seccomp_data, nr)),
                           BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, SYS_openat2, 0, 1),
                           BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ERRNO | EPERM),
                           BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ALLOW)};
    const sock_fprog program{std::size(steps), steps};
    prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0);
    EXPECT_EQ(prctl(PR_SET_SECCOMP, SECCOMP_MODE_FILTER, &program), 0);
    EXPECT_EQ(readWholeFile(device.hostPath("inside/file"), error), "inside");
    EXPECT_FALSE(readWholeFile(device.hostPath("link/file"), error));
  })));
}

TEST_F(AtomicFileTest, ReadsNoMoreThanADocumentHas) {
  folder.write("document", "");
  ASSERT_EQ(truncate(folder.path("document").c_str(), off_t{1} << 40), 0);
  EXPECT_FALSE(readWholeFile(folder.path("document"), error));
  EXPECT_EQ(error, folder.path("document") + ": larger than 268435456 bytes");
  largestAllocation = 8'192;
  EXPECT_FALSE(readWholeFile(std::string("/proc/self/smaps"), error, nullptr, 100));  // says 0
  largestAllocation = SIZE_MAX;
  ASSERT_EQ(mkfifo(folder.path("pipe").c_str(), 0600), 0);
  EXPECT_FALSE(readWholeFile(folder.path("pipe"), error));
  EXPECT_EQ(error, folder.path("pipe") + ": not a regular file");
}

TEST_F(JsonLinesTest, KeepTheNewestOfTooMany) {
  const std::string path = folder.path("log.jsonl");
  const auto isOld = [](std::string_view line) { return line == "old"; };
  JsonLines lines(path);
  folder.write("log.jsonl", "first\nsecond\nold\nlast\n");
  std::uint64_t bytes = 0;
  EXPECT_EQ(lines.countRemoved(isOld, bytes, error, 16), 2U);
  EXPECT_EQ(bytes, 10U);
  EXPECT_EQ(lines.remove(isOld, error, 16), 2U);
  EXPECT_EQ(folder.read("log.jsonl"), "second\nlast\n");
  // A hole between its ends; the last bytes begin within a line.
  folder.write("log.jsonl", "first line\n");
  ASSERT_EQ(truncate(path.c_str(), kMaxLinesFile), 0);
  EXPECT_TRUE(lines.append("{}", error)) << error;
  largestAllocation = 64 << 20;
  std::vector<std::string> read;
  EXPECT_TRUE(forEachLineOf(
      path, [&](std::string_view line) { read.emplace_back(line); }, error));
  EXPECT_THAT(read, ElementsAre("t line", "", "{}"));
  EXPECT_TRUE(lines.remove(isOld, error, 2 * kMaxLinesFile)) << error;
  largestAllocation = SIZE_MAX;
  EXPECT_EQ(folder.read("log.jsonl"), "{}\n");
}

TEST_F(JsonLinesTest, AppendsWholeLinesFromManyWriters) {
  JsonLines first(folder.path("events.jsonl"));
  JsonLines second(folder.path("events.jsonl"));
  const std::string line(500, 'x');
  const auto write = [&line](JsonLines& lines) {
    std::string reason;
    for (int count = 0; count < 200; ++count) {
      EXPECT_TRUE(lines.append(line, reason)) << reason;
    }
  };
  std::thread shared(write, std::ref(first));
  std::thread other(write, std::ref(second));
  write(first);
  shared.join();
  other.join();
  std::istringstream written(folder.read("events.jsonl"));
  int count = 0;
  for (std::string text; std::getline(written, text); ++count) {
    EXPECT_EQ(text, line);
  }
  EXPECT_EQ(count, 600);
  EXPECT_EQ(modeOf("events.jsonl"), mode_t{S_IFREG | 0600});
}

TEST_F(JsonLinesTest, EndsATornLineAndMakesADeletedFileAnew) {
  folder.write("log.jsonl", "{\"whole\":1}\n{\"to");
  JsonLines lines(folder.path("log.jsonl"));
  EXPECT_TRUE(lines.append("{}", error)) << error;
  EXPECT_EQ(folder.read("log.jsonl"), "{\"whole\":1}\n{\"to\n{}\n");
  EXPECT_FALSE(lines.append("two\nlines", error));
  std::thread waiting;
  {
    const FileDescriptor locked(open(folder.path("log.jsonl").c_str(), O_RDONLY));
    flock(locked.get(), LOCK_EX);
    waiting = std::thread([&] { EXPECT_TRUE(lines.append("{}", error)) << error; });
    std::this_thread::sleep_for(std::chrono::milliseconds(50));
    unlink(folder.path("log.jsonl").c_str());
  }
  waiting.join();
  EXPECT_EQ(folder.read("log.jsonl"), "{}\n");
}

TEST_F(JsonLinesTest, LoseNoLineWhileOthersAreRemoved) {
  const std::string path = folder.path("log.jsonl");
  const auto isOld = [](std::string_view line) { return line == "old"; };
  JsonLines lines(path);
  constexpr int kLines = 300;
  std::atomic<bool> done = false;
  std::uint64_t removed = 0;
  std::thread removing([&] {
    JsonLines others(path);
    std::string why;
    while (!done) {
      const auto count = others.remove(isOld, why);
      EXPECT_TRUE(count) << why;
      removed += count.value_or(0);
    }
  });
  for (int line = 0; line < kLines; ++line) {
    EXPECT_TRUE(lines.append("old", error) && lines.append("new", error)) << error;
  }
  done = true;
  removing.join();
  EXPECT_EQ(removed + lines.remove(isOld, error).value_or(0), kLines);
  EXPECT_EQ(folder.read("log.jsonl").size(), 4U * kLines);
  folder.write("log.jsonl", std::string("old\nto\0rn\n\nold\nto", 17));
  EXPECT_EQ(lines.remove(isOld, error), 2U);
  EXPECT_EQ(folder.read("log.jsonl"), std::string("to\0rn\n\nto", 9));
}

TEST_F(JsonLinesTest, OpensRegularFilesAloneAndKeepsThemToTheirOwner) {
  folder.write("shared.jsonl", "");
  chmod(folder.path("shared.jsonl").c_str(), 0666);
  EXPECT_TRUE(JsonLines(folder.path("shared.jsonl")).append("{}", error)) << error;
  EXPECT_EQ(modeOf("shared.jsonl"), mode_t{S_IFREG | 0600});
  ASSERT_EQ(symlink("shared.jsonl", folder.path("link.jsonl").c_str()), 0);
  EXPECT_FALSE(JsonLines(folder.path("link.jsonl")).append("{}", error));
  EXPECT_EQ(error, folder.path("link.jsonl") + ": a symbolic link");
  EXPECT_EQ(folder.read("shared.jsonl"), "{}\n");
  ASSERT_EQ(link(folder.path("shared.jsonl").c_str(), folder.path("second.jsonl").c_str()), 0);
  EXPECT_FALSE(JsonLines(folder.path("second.jsonl")).append("{}", error));
  EXPECT_EQ(error, folder.path("second.jsonl") + ": has a second name");
  folder.write("other.jsonl", "");
  if (chown(folder.path("other.jsonl").c_str(), 12345, 12345) == 0) {  // as root
    EXPECT_FALSE(JsonLines(folder.path("other.jsonl")).append("{}", error));
    EXPECT_EQ(error, folder.path("other.jsonl") + ": belongs to another user");
  }
  ASSERT_EQ(mkfifo(folder.path("pipe.jsonl").c_str(), 0600), 0);
  EXPECT_FALSE(JsonLines(folder.path("pipe.jsonl")).append("{}", error));
  EXPECT_EQ(error, folder.path("pipe.jsonl") + ": not a regular file");
}

TEST_F(JsonLinesTest, TakesBackALineThatDidNotFit) {
  JsonLines lines(folder.path("log.jsonl"));
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

TEST_F(JsonLinesTest, WaitOnceForALockThatNobodyReleases) {
  folder.write("log.jsonl", "");
  const auto began = std::chrono::steady_clock::now();
  JsonLines lines(folder.path("log.jsonl"), std::chrono::milliseconds(50));
  {
    const FileDescriptor stopped(open(folder.path("log.jsonl").c_str(), O_RDONLY));
    flock(stopped.get(), LOCK_EX);
    for (int line = 0; line < 1000; ++line) {
      EXPECT_FALSE(lines.append("{}", error));
    }
    EXPECT_EQ(error, folder.path("log.jsonl") + ": another process keeps it locked");
  }
  EXPECT_TRUE(lines.append("{}", error)) << error;
  EXPECT_LT(std::chrono::steady_clock::now() - began, std::chrono::seconds(20));
  EXPECT_FALSE(takeLock(-1, LOCK_EX, std::chrono::milliseconds(0), "name", error));
  EXPECT_EQ(error, "name: Bad file descriptor");
}

}  // namespace
}  // namespace vesprun

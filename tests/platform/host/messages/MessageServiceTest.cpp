#include <sys/socket.h>

#include <chrono>
#include <thread>

#include "platform/host/messages/HostMessageService.h"
#include "platform/host/messages/MessageFraming.h"
#include "platform/host/messages/ServiceSocket.h"
#include "support/HostServiceTest.h"

namespace vesprun {
namespace {

using ::testing::ElementsAre, ::testing::HasSubstr, ::testing::IsEmpty;

using SliceResult = MainLoop::SliceResult;

constexpr const char* kName = "com.quill.aggregated.vesprun";
constexpr const char* kSocket = "run/com.quill.aggregated.vesprun";
constexpr double kQuiet = 0.02;

std::string text(const std::string& content) {
  return "<ptree version=\"1.0\"><string>" + content + "</string></ptree>";
}

std::string frame(const std::string& document) { return messageFrame(document).value(); }

class MessageServiceTest : public HostServiceTest {
 protected:
  std::unique_ptr<ServiceListener> listen() {
    return service.createListener(kName, [this](const PropertyValue& message) {
      received.push_back(message.string() != nullptr ? *message.string() : "?");
    });
  }

  FileDescriptor peer() {
    FileDescriptor socket = connectToService(device, kName, 5, error);
    EXPECT_TRUE(socket.isOpen()) << error;
    return socket;
  }

  static void send(const FileDescriptor& socket, std::string_view bytes) {
    EXPECT_EQ(::send(socket.get(), bytes.data(), bytes.size(), MSG_NOSIGNAL),
              static_cast<ssize_t>(bytes.size()));
  }

  /// Whether the service has closed the connection.
  static bool isEnded(const FileDescriptor& socket) {
    char byte = 0;
    return recv(socket.get(), &byte, 1, MSG_DONTWAIT) == 0 ||
           (errno != EAGAIN && errno != EWOULDBLOCK);
  }

  int eventsUntilQuiet() {
    int events = 0;
    while (loop.runMainLoopSlice(kQuiet) == SliceResult::HandledEvent) {
      ++events;
    }
    return events;
  }

  HostMainLoop loop;
  HostMessageService service{device, log, loop};
  std::vector<std::string> received;
};

TEST_F(MessageServiceTest, DeliversOneMessageForEachSlice) {
  const std::unique_ptr<ServiceListener> listener = listen();
  const std::string longText(150'000, 'x');
  {
    const FileDescriptor hasty = peer();
    send(hasty,
         frame(text("a")) + frame("<ptree version=\"1.0\"><array/></ptree>") + frame(text("c")));
  }  // gone before anything is read
  EXPECT_EQ(loop.runMainLoopSlice(1), SliceResult::HandledEvent);
  EXPECT_THAT(received, IsEmpty());  // the peer itself was the event
  EXPECT_EQ(loop.runMainLoopSlice(1), SliceResult::HandledEvent);
  EXPECT_THAT(received, ElementsAre("a"));
  EXPECT_EQ(eventsUntilQuiet(), 2);
  const FileDescriptor slow = peer();
  for (const char byte : frame(text("d"))) {
    send(slow, {&byte, 1});
    loop.runMainLoopSlice(0);
  }
  send(slow, frame(text(longText)));
  EXPECT_EQ(eventsUntilQuiet(), 1);
  EXPECT_THAT(received, ElementsAre("a", "?", "c", "d", longText));
  EXPECT_THAT(log.messages, IsEmpty());
}

TEST_F(MessageServiceTest, DropsOnlyThePeerThatSendsNoMessage) {
  const std::unique_ptr<ServiceListener> listener = listen();
  const struct {
    std::string bytes;
    const char* reason;
  } kCases[] = {
      {frame("garbage"), "line 1"},
      {std::string("\x01\x00\x00\x01", 4), "a message is longer than 16777216 bytes"},
      {std::string("\xFF\xFF\xFF\xFF", 4) + text("x"), "a message is longer than 16777216 bytes"},
      {frame(text("half")).substr(0, 30), "it ended in the middle of a message"},
      {frame(text("good")) + frame("<ptree version=\"1.0\"/>"), "line 1"},
      {std::string("\x00\x00\x00\x01", 4), "it ended in the middle of a message"},  // 16 MiB
  };
  const FileDescriptor staller = peer();
  send(staller, frame(text("late")).substr(0, 20));
  eventsUntilQuiet();
  for (const auto& [bytes, reason] : kCases) {
    SCOPED_TRACE(::testing::PrintToString(bytes));
    log.messages.clear();
    const FileDescriptor bad = peer();
    send(bad, bytes);
    shutdown(bad.get(), SHUT_WR);
    eventsUntilQuiet();
    EXPECT_TRUE(isEnded(bad));
    EXPECT_THAT(log.messages, ElementsAre(HasSubstr("a peer is dropped: " + std::string(reason))));
  }
  EXPECT_THAT(received, ElementsAre("good"));
  send(staller, std::string_view(frame(text("late"))).substr(20));
  eventsUntilQuiet();
  EXPECT_THAT(received, ElementsAre("good", "late"));
}

TEST_F(MessageServiceTest, BytesOfNoMessageDoNotProlongASlice) {
  const std::unique_ptr<ServiceListener> listener = listen();
  const FileDescriptor dribbler = peer();
  ASSERT_EQ(loop.runMainLoopSlice(1), SliceResult::HandledEvent);
  std::jthread dribble([&dribbler](const std::stop_token& stop) {
    const std::string bytes = frame(std::string(1'000'000, ' '));
    for (std::size_t i = 0; i < bytes.size() && !stop.stop_requested(); ++i) {
      send(dribbler, std::string_view(bytes).substr(i, 1));
      std::this_thread::sleep_for(std::chrono::milliseconds(5));
    }
  });
  const auto start = std::chrono::steady_clock::now();
  EXPECT_EQ(loop.runMainLoopSlice(0.1), SliceResult::TimedOut);
  const auto duration = std::chrono::steady_clock::now() - start;
  EXPECT_GE(duration, std::chrono::milliseconds(100));
  EXPECT_LT(duration, std::chrono::seconds(2));
  const FileDescriptor other = peer();
  send(other, frame(text("served")));
  eventsUntilQuiet();
  EXPECT_THAT(received, ElementsAre("served"));
}

TEST_F(MessageServiceTest, APeerBeyondTheLimitTakesThePlaceOfTheQuietest) {
  const std::unique_ptr<ServiceListener> listener = listen();
  std::vector<FileDescriptor> stallers;
  for (int i = 0; i < 16; ++i) {
    stallers.push_back(peer());
    eventsUntilQuiet();
  }
  send(stallers.front(), "\x01");
  eventsUntilQuiet();
  const FileDescriptor last = peer();
  send(last, frame(text("served")));
  eventsUntilQuiet();
  EXPECT_THAT(received, ElementsAre("served"));
  EXPECT_TRUE(isEnded(stallers[1]));
  EXPECT_FALSE(isEnded(stallers[0]));
}

TEST_F(MessageServiceTest, APeerThatHasSentAMessageOutlivesThoseThatHaveNot) {
  const std::unique_ptr<ServiceListener> listener = listen();
  const FileDescriptor client = peer();
  send(client, frame(text("first")));
  eventsUntilQuiet();
  std::vector<FileDescriptor> others;
  for (int i = 0; i < 40; ++i) {
    others.push_back(peer());
    send(others.back(), "\x01");
    eventsUntilQuiet();
  }
  EXPECT_TRUE(isEnded(others[24]));
  EXPECT_FALSE(isEnded(others[25]));
  send(client, frame(text("second")));
  eventsUntilQuiet();
  EXPECT_THAT(received, ElementsAre("first", "second"));
}

TEST_F(MessageServiceTest, TurnsAwayAnotherUser) {
  if (geteuid() != 0) {
    GTEST_SKIP() << "only root can become another user";
  }
  const std::unique_ptr<ServiceListener> listener = listen();
  for (const std::string& path : {folder.path(), folder.path("run"), folder.path(kSocket)}) {
    ASSERT_EQ(chmod(path.c_str(), 0777), 0);
  }
  ASSERT_TRUE(hasSucceeded(startProcess([&] {
    EXPECT_EQ(setuid(65534), 0);
    peer();
  })));
  EXPECT_EQ(eventsUntilQuiet(), 0);
  EXPECT_THAT(log.messages, ElementsAre(HasSubstr("a peer of another user is turned away")));
}

TEST_F(MessageServiceTest, TheSocketFileIsItsOwnersAndGoesWithTheListener) {
  std::unique_ptr<ServiceListener> listener = listen();
  EXPECT_EQ(modeOf(kSocket), mode_t{S_IFSOCK | 0600});
  // A live one: the second holder gets nothing and takes nothing.
  EXPECT_EQ(listen(), nullptr);
  EXPECT_THAT(log.messages, ElementsAre(HasSubstr("another process offers the service")));
  {
    const FileDescriptor client = peer();
    send(client, frame(text("still here")));
    loop.runMainLoopSlice(1);  // the message that is being received dies with the listener
  }
  listener.reset();
  EXPECT_EQ(eventsUntilQuiet(), 0);
  EXPECT_THAT(received, IsEmpty());
  EXPECT_THAT(folder.names("run"), IsEmpty());
  EXPECT_FALSE(connectToService(device, kName, 1, error).isOpen());
  EXPECT_EQ(error, folder.path(kSocket) + ": nobody offers the service: start vesprun first");
  // What took its name meanwhile is left alone, and a file that is no socket stands in the way.
  listener = listen();
  unlink(folder.path(kSocket).c_str());
  folder.write(kSocket, "mine");
  listener.reset();
  EXPECT_EQ(folder.read(kSocket), "mine");
  log.messages.clear();
  EXPECT_EQ(listen(), nullptr);
  EXPECT_THAT(log.messages, ElementsAre(folder.path(kSocket) + ": Address already in use"));
}

TEST_F(MessageServiceTest, SaysOnceThatItHasNoDescriptorLeft) {
  ASSERT_TRUE(hasSucceeded(startProcess([&] {
    const std::unique_ptr<ServiceListener> listener = listen();
    const FileDescriptor client = peer();
    const rlimit standardStreams{3, 3};
    setrlimit(RLIMIT_NOFILE, &standardStreams);
    EXPECT_EQ(eventsUntilQuiet(), 0);
    EXPECT_EQ(listen(), nullptr);
    EXPECT_THAT(log.messages, ElementsAre(HasSubstr("no peer can be accepted: Too many open files"),
                                          folder.path("run") + ": Too many open files"));
  })));
}

TEST_F(MessageServiceTest, TakesOverFromAKilledProcessUnderAPathTooLongForASocketAddress) {
  const std::string deep(120, 'd');
  folder.write(deep + "/device.json", "{}");
  device = DeviceDirectory::open(folder.path(deep), error).value();
  ASSERT_TRUE(hasSucceeded(startProcess([&] {
    EXPECT_NE(listen().release(), nullptr);  // nothing is cleaned up
  })));
  EXPECT_THAT(folder.names(deep + "/run"), ElementsAre(kName));
  std::unique_ptr<ServiceListener> listener = listen();
  ASSERT_NE(listener, nullptr);
  const FileDescriptor client = peer();
  send(client, frame(text("a")));
  eventsUntilQuiet();
  EXPECT_THAT(received, ElementsAre("a"));
  listener.reset();
  EXPECT_THAT(folder.names(deep + "/run"), IsEmpty());
}

}  // namespace
}  // namespace vesprun

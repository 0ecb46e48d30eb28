// Runs two commands in turn and prints the ratio of their median wall times, with the peak memory
// of the first.

#include <fcntl.h>
#include <spawn.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

namespace {

struct Command {
  std::vector<char*> arguments;  ///< with the null pointer at the end
  std::vector<double> milliseconds;
  long peakKibibytes = 0;

  double median() {
    const auto middle = milliseconds.begin() + static_cast<std::ptrdiff_t>(milliseconds.size() / 2);
    std::nth_element(milliseconds.begin(), middle, milliseconds.end());
    return *middle;
  }
};

/// What it writes goes nowhere.
void run(Command& command) {
  posix_spawn_file_actions_t actions;
  posix_spawn_file_actions_init(&actions);
  posix_spawn_file_actions_addopen(&actions, STDOUT_FILENO, "/dev/null", O_WRONLY, 0);
  posix_spawn_file_actions_adddup2(&actions, STDOUT_FILENO, STDERR_FILENO);
  const auto start = std::chrono::steady_clock::now();
  pid_t process = 0;
  const int failure = posix_spawnp(&process, command.arguments[0], &actions, nullptr,
                                   command.arguments.data(), environ);
  posix_spawn_file_actions_destroy(&actions);
  if (failure != 0) {
    throw std::runtime_error(std::string(command.arguments[0]) + ": " + std::strerror(failure));
  }
  int status = 0;
  rusage usage{};
  wait4(process, &status, 0, &usage);
  const std::chrono::duration<double, std::milli> took = std::chrono::steady_clock::now() - start;
  if (status != 0) {
    throw std::runtime_error(std::string(command.arguments[0]) + " failed");
  }
  command.milliseconds.push_back(took.count());
  command.peakKibibytes = std::max(command.peakKibibytes, usage.ru_maxrss);
}

/// The arguments up to the next "against", which is stepped over.
Command takeCommand(char**& argument) {
  Command command;
  for (; *argument != nullptr && std::string_view(*argument) != "against"; ++argument) {
    command.arguments.push_back(*argument);
  }
  if (command.arguments.empty()) {
    throw std::runtime_error("a command is missing");
  }
  command.arguments.push_back(nullptr);
  argument += *argument != nullptr ? 1 : 0;
  return command;
}

void compare(int rounds, const char* title, const char* target, char** arguments) {
  Command measured = takeCommand(arguments);
  Command reference = takeCommand(arguments);
  for (int round = 0; round < rounds; ++round) {
    run(measured);
    run(reference);
  }
  const double time = measured.median();
  const double referenceTime = reference.median();
  std::printf("%-44s %8.3f   %s   (%.2f ms against %.2f ms; peak %.1f MiB)\n", title,
              time / referenceTime, target, time, referenceTime,
              static_cast<double>(measured.peakKibibytes) / 1024);
}

}  // namespace

int main(int argc, char** argv) {
  const int rounds = argc > 6 ? std::atoi(argv[1]) : 0;
  if (rounds < 1) {
    std::fputs("usage: CompareCommands ROUNDS TITLE TARGET COMMAND... against COMMAND...\n",
               stderr);
    return 2;
  }
  try {
    compare(rounds, argv[2], argv[3], argv + 4);
  } catch (const std::exception& failure) {
    std::fprintf(stderr, "CompareCommands: %s\n", failure.what());
    return 1;
  }
  return 0;
}

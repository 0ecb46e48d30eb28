/* Runs a command and counts it: how often it ran and failed, how long it took, how much memory it
 * had at most. With vesprun installed:
 *
 *   cc main.c $(pkg-config --cflags --libs vesprun) -o time-command
 *   ./time-command SOCKET KEY COMMAND [ARGUMENT...]
 *
 * As any user, with the socket /run/vesprun/counters and a KEY that begins with "app.". In place of
 * the socket, its owner may name a device directory.
 */

#include <stdio.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <time.h>
#include <unistd.h>
#include <vesprun/vesprun.h>

static double seconds_now(void) {
  struct timespec now;
  clock_gettime(CLOCK_MONOTONIC, &now);
  return (double)now.tv_sec + (double)now.tv_nsec / 1e9;
}

static const char* key_of(const char* prefix, const char* name) {
  static char key[256];
  snprintf(key, sizeof key, "%.200s.%s", prefix, name);
  return key;
}

int main(int argc, char** argv) {
  if (argc < 4) {
    fputs("usage: time-command SOCKET KEY COMMAND [ARGUMENT...]\n", stderr);
    return 2;
  }
  const double begin = seconds_now();
  const pid_t child = fork();
  if (child == 0) {
    execvp(argv[3], argv + 3);
    perror(argv[3]);
    _exit(127);
  }
  int status = 0;
  struct rusage usage;
  if (child < 0 || wait4(child, &status, 0, &usage) != child) {
    perror("time-command");
    return 1;
  }
  const double milliseconds = (seconds_now() - begin) * 1000;

  /* A command that was run does not fail because nobody counts. */
  vesprun_device* device = vesprun_open(argv[1]);
  if (device == NULL || vesprun_add_to_scalar(device, key_of(argv[2], "runs"), 1) != 0 ||
      vesprun_add_to_scalar(device, key_of(argv[2], "failures"), status != 0) != 0 ||
      vesprun_add_to_distribution(device, key_of(argv[2], "milliseconds"), milliseconds) != 0 ||
      vesprun_add_to_distribution(device, key_of(argv[2], "memoryKiB"), (double)usage.ru_maxrss) !=
          0 ||
      vesprun_checkpoint(device) != 0) {
    fprintf(stderr, "time-command: %s\n", vesprun_last_error());
  }
  vesprun_close(device);
  return WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
}

/* Counts the lines of its standard input, and how long they are, as counters of a device. With
 * vesprun installed:
 *
 *   cc main.c $(pkg-config --cflags --libs vesprun) -o count-lines
 *   ./count-lines DIRECTORY KEY <FILE
 *
 * KEY.lines becomes a scalar, KEY.length a distribution. `vespctl init DIRECTORY` makes a device to
 * try, and `vespctl counters dump` shows them.
 */

#include <stdio.h>
#include <string.h>
#include <vesprun/vesprun.h>

static int fail(vesprun_device* device) {
  fprintf(stderr, "count-lines: %s\n", vesprun_last_error());
  vesprun_close(device);
  return 1;
}

int main(int argc, char** argv) {
  if (argc != 3) {
    fputs("usage: count-lines DIRECTORY KEY\n", stderr);
    return 2;
  }
  vesprun_device* device = vesprun_open(argv[1]);
  if (device == NULL) {
    return fail(NULL);
  }
  char lines[256];
  char length[256];
  snprintf(lines, sizeof lines, "%.200s.lines", argv[2]);
  snprintf(length, sizeof length, "%.200s.length", argv[2]);

  char line[65536];
  while (fgets(line, sizeof line, stdin) != NULL) {
    if (vesprun_add_to_scalar(device, lines, 1) != 0 ||
        vesprun_add_to_distribution(device, length, (double)strcspn(line, "\n")) != 0) {
      return fail(device);
    }
  }

  /* From here on the counters are safe, whatever happens to the machine. */
  if (vesprun_checkpoint(device) != 0) {
    return fail(device);
  }

  /* The health of the storage, as JSON. */
  char* health = vesprun_call(device, "CopyInternalLabNANDInfo", NULL);
  if (health == NULL) {
    return fail(device);
  }
  puts(health);
  vesprun_free(health);
  vesprun_close(device);
  return 0;
}

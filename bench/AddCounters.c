/* Adds to counters as another program does, through the library: AddCounters DEVICE ADDS KEYS BATCH
 * adds ADDS times to KEYS counters in turn, with a checkpoint after each BATCH. */

#include <stdio.h>
#include <stdlib.h>

#include "vesprun/vesprun.h"

int main(int argc, char** argv) {
  vesprun_device* device = argc == 5 ? vesprun_open(argv[1]) : NULL;
  if (device == NULL) {
    fprintf(stderr, "AddCounters: %s\n", vesprun_last_error());
    return 1;
  }
  const long adds = atol(argv[2]);
  const long keys = atol(argv[3]);
  const long batch = atol(argv[4]);
  int failed = 0;
  for (long i = 0; i < adds && !failed; ++i) {
    char key[64];
    snprintf(key, sizeof key, "com.example.requests.%06ld", i % keys);
    failed = vesprun_add_to_scalar(device, key, 1) != 0;
    if ((i + 1) % batch == 0 || i + 1 == adds) {
      failed = failed || vesprun_checkpoint(device) != 0;
    }
  }
  if (failed) {
    fprintf(stderr, "AddCounters: %s\n", vesprun_last_error());
  }
  vesprun_close(device);
  return failed;
}

#ifndef VESPRUN_VESPRUN_H
#define VESPRUN_VESPRUN_H

/*
 * vesprun for programs in C and in every language that can call C: counters of a device, and the
 * statistics of its storage as JSON. C++ programs have `vesprun.hpp` as well.
 *
 * No function ends the program, throws, or keeps a pointer that it was given. Texts are UTF-8 with
 * a zero at the end. A null pointer where something is needed is an error like any other. After a
 * failure `vesprun_last_error` has the text.
 *
 * The functions may be called from any thread, `vesprun_close` only when no other thread uses the
 * device any more. After a fork only one of the two processes may use it.
 */

#include <stdint.h>

#include "Export.h"

#ifdef __cplusplus
extern "C" {
#endif

/** An open device directory. */
typedef struct vesprun_device vesprun_device;

/** The version of the library, such as "0.1.0". */
VESPRUN_EXPORT const char* vesprun_version(void);

/**
 * The error of this thread's last call that failed, which names the place; "" when none has. Valid
 * until the thread's next call that fails.
 */
VESPRUN_EXPORT const char* vesprun_last_error(void);

/**
 * Opens a device directory. Null when the folder or its `device.json` cannot be used, or when
 * another device is open: a process has one at a time. The device's time zone, if it describes one,
 * becomes that of the process, in the environment variable TZ, until it is closed.
 */
VESPRUN_EXPORT vesprun_device* vesprun_open(const char* directory);

/**
 * Makes a last checkpoint and closes the device. When that fails, the changes are lost and only the
 * device's system log says so: call `vesprun_checkpoint` first to know. Null is allowed.
 */
VESPRUN_EXPORT void vesprun_close(vesprun_device* device);

/*
 * Counters of today, by the device's clock; days begin at 00:00 UTC. A key is text that an XML 1.0
 * document can carry, 1 MiB at most. Changes stay in memory until the next checkpoint. Each
 * function returns 0, or -1 on failure, with nothing changed.
 */

/** Sets a scalar. */
VESPRUN_EXPORT int vesprun_set_scalar(vesprun_device* device, const char* key, int64_t value);

/** Adds to a scalar, wrapping in 64 bits; a missing one counts as 0. */
VESPRUN_EXPORT int vesprun_add_to_scalar(vesprun_device* device, const char* key, int64_t value);

/** Adds one more value to a distribution. */
VESPRUN_EXPORT int vesprun_add_to_distribution(vesprun_device* device, const char* key,
                                               double value);

/**
 * Writes all changes in one transaction, which survives a loss of power once 0 is returned. On
 * failure nothing was written, and the changes wait for the next checkpoint. Waits for the locks of
 * other processes, 20 seconds at most.
 */
VESPRUN_EXPORT int vesprun_checkpoint(vesprun_device* device);

/**
 * Calls an entry point, by its name or by that of the command of `vespctl nand`, which lists them:
 * "CopyInternalLabNANDInfo" or "lab". `arguments` is a JSON object of the command's arguments, such
 * as {"hours":24,"raw":true}, or null for none.
 *
 * Returns {"result":VALUE,"error":TEXT}, to be released with `vesprun_free`: the value, or null, in
 * the JSON form of `vespctl`, and the first error text of the process or "NA". Returns a null
 * pointer for an unknown entry point or argument, or when memory runs out. Calls from several
 * threads wait for each other. Some entry points print lines on the standard streams.
 */
VESPRUN_EXPORT char* vesprun_call(vesprun_device* device, const char* entry_point,
                                  const char* arguments);

/** Releases what `vesprun_call` returned. Null is allowed. */
VESPRUN_EXPORT void vesprun_free(char* text);

#ifdef __cplusplus
}
#endif

#endif

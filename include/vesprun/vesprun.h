#ifndef VESPRUN_VESPRUN_H
#define VESPRUN_VESPRUN_H

/*
 * vesprun for programs in C and in every language that can call C: counters of a device, and the
 * statistics of its storage as JSON. C++ programs have `vesprun.hpp` as well.
 *
 * No function ends the program, throws, or keeps a pointer that it was given. Texts are UTF-8 with
 * a zero at the end. A null pointer where something is needed is an error like any other. What
 * fails leaves its text with `vesprun_last_error`.
 *
 * The functions may be called from any thread; `vesprun_close` when no other thread uses the device
 * any more. A process that has forked uses the device in one of the two processes only.
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
 * Why the last call of this thread that failed did so, naming the place; "" before. Valid until the
 * thread's next call that fails.
 */
VESPRUN_EXPORT const char* vesprun_last_error(void);

/**
 * Opens a device directory. Null when the folder or its `device.json` cannot be used, or when
 * another device is open: a process has one at a time. The device's time zone, if it describes one,
 * becomes that of the process, in the environment variable TZ, until it is closed.
 */
VESPRUN_EXPORT vesprun_device* vesprun_open(const char* directory);

/**
 * Makes a last checkpoint and closes the device. What cannot be written is lost, and the device's
 * system log says so; who wants to know calls `vesprun_checkpoint` first. Null is allowed.
 */
VESPRUN_EXPORT void vesprun_close(vesprun_device* device);

/*
 * Counters of today, by the device's clock; days begin at 00:00 UTC. A key is text that an XML 1.0
 * document can carry, 1 MiB at most. Changes are collected in memory until the next checkpoint.
 * Each function gives 0, or -1 when it failed: nothing was changed then.
 */

/** Sets a scalar. */
VESPRUN_EXPORT int vesprun_set_scalar(vesprun_device* device, const char* key, int64_t value);

/** Adds to a scalar, wrapping in 64 bits; a missing one counts as 0. */
VESPRUN_EXPORT int vesprun_add_to_scalar(vesprun_device* device, const char* key, int64_t value);

/** Adds one more value to a distribution. */
VESPRUN_EXPORT int vesprun_add_to_distribution(vesprun_device* device, const char* key,
                                               double value);

/**
 * Writes all that was collected in one transaction: all of it outlives a loss of power when 0 is
 * returned. With -1 nothing was written, and it waits for the next checkpoint. What other processes
 * have locked is waited for, 20 seconds at most.
 */
VESPRUN_EXPORT int vesprun_checkpoint(vesprun_device* device);

/**
 * Calls an entry point, by its name or by that of the command of `vespctl nand`, which lists them:
 * "CopyInternalLabNANDInfo" or "lab". `arguments` is a JSON object of the command's arguments, such
 * as {"hours":24,"raw":true}, or null for none.
 *
 * Gives {"result":VALUE,"error":TEXT}, in the JSON form of `vespctl`: null for an entry point that
 * answers nothing, and the first error text of the process or "NA". The text is released with
 * `vesprun_free`. Null when there is no such entry point or argument, or memory runs out. Calls
 * from several threads wait for each other; some entry points print lines on the standard streams.
 */
VESPRUN_EXPORT char* vesprun_call(vesprun_device* device, const char* entry_point,
                                  const char* arguments);

/** Releases what `vesprun_call` gave. Null is allowed. */
VESPRUN_EXPORT void vesprun_free(char* text);

#ifdef __cplusplus
}
#endif

#endif

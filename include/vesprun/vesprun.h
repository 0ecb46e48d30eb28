#ifndef VESPRUN_VESPRUN_H
#define VESPRUN_VESPRUN_H

/*
 * vesprun for programs in C and in every language that can call C: counters of a device, and the
 * statistics of its storage as JSON. C++ programs have `vesprun.hpp` as well.
 *
 * No function ends the program, throws, or keeps a pointer that it was given. Texts are UTF-8 with
 * a zero at the end. A null pointer where something is needed is an error like any other. After a
 * failure `vesprun_last_error_code` has the reason and `vesprun_last_error` the text.
 *
 * The functions may be called from any thread, `vesprun_close` only when no other thread uses the
 * device any more. In a process that was forked after the device was opened, every function refuses
 * it; `vesprun_close` releases it there and writes nothing. Fork while no thread opens or closes
 * one.
 *
 * The environment of the process stays as it is, but for TZ while an entry point formats the date
 * of the NAND log, when the device describes a time zone.
 */

#include <stdint.h>

#include "Export.h"

#ifdef __cplusplus
extern "C" {
#endif

/* The version of this header. `vesprun_version` tells that of the library. */
#define VESPRUN_VERSION_MAJOR 0
#define VESPRUN_VERSION_MINOR 1
#define VESPRUN_VERSION_PATCH 0

/** Why a call failed. More reasons may come: treat an unknown one as `VESPRUN_ERROR_OTHER`. */
typedef enum vesprun_error {
  VESPRUN_ERROR_NONE = 0,         /**< no call has failed */
  VESPRUN_ERROR_OTHER = 1,        /**< what the text says */
  VESPRUN_ERROR_ARGUMENT = 2,     /**< a null pointer, an unknown entry point or argument */
  VESPRUN_ERROR_KEY = 3,          /**< text that is no counter key */
  VESPRUN_ERROR_NOT_A_DEVICE = 4, /**< the folder or its `device.json` cannot be used */
  VESPRUN_ERROR_BUSY = 5,         /**< another device is open, or another process holds a lock */
  VESPRUN_ERROR_FULL = 6,         /**< the disk is full */
  VESPRUN_ERROR_TOO_OLD = 7,      /**< a newer version has made the device's counters */
  VESPRUN_ERROR_FORKED = 8,       /**< the device was opened before the process was forked */
  VESPRUN_ERROR_MEMORY = 9,       /**< memory ran out */
  VESPRUN_ERROR_SOCKET = 10       /**< not over a socket: entry points need a device directory */
} vesprun_error;

/** An open device directory. */
typedef struct vesprun_device vesprun_device;

/** The version of the library, such as "0.1.0". */
VESPRUN_EXPORT const char* vesprun_version(void);

/**
 * The error of this thread's last call that failed, which names the place; "" when none has. Cut to
 * 1,023 bytes, in a buffer of the thread that its next call that fails overwrites.
 */
VESPRUN_EXPORT const char* vesprun_last_error(void);

/** The reason of the same call. */
VESPRUN_EXPORT vesprun_error vesprun_last_error_code(void);

/**
 * Opens a device directory. Null when the folder or its `device.json` cannot be used, or when
 * another device is open: a process has one at a time.
 *
 * With the path of the socket of `vespctl listen` in place of a folder, such as
 * "/run/vesprun/counters", counters go there, as any user; null when nobody listens. Any number of
 * sockets may be open.
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
 *
 * Over a socket, changes are collected until they fill a datagram, which then is sent, and counted
 * when it arrives. Keys have about 8,000 bytes at most, without ":" and "|", values are finite, and
 * what the listener drops, since the user may not count the key, say, does not fail here. A full
 * socket is waited for, 5 seconds at most.
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
 * other processes, 20 seconds at most. Over a socket it sends what is collected, which the listener
 * writes within 10 seconds.
 */
VESPRUN_EXPORT int vesprun_checkpoint(vesprun_device* device);

/**
 * Calls an entry point, by its name or by that of the command of `vespctl nand`, which lists them:
 * "CopyInternalLabNANDInfo" or "lab". `arguments` is a JSON object of the command's arguments, such
 * as {"hours":24,"raw":true}, or null for none.
 *
 * Returns {"result":VALUE,"error":TEXT}, to be released with `vesprun_free`: the value, or null, in
 * the JSON form of `vespctl`, and the first error text of this call or "NA". Returns a null
 * pointer for an unknown entry point or argument, or when memory runs out. Calls from several
 * threads wait for each other. Some entry points print lines on the standard streams.
 */
VESPRUN_EXPORT char* vesprun_call(vesprun_device* device, const char* entry_point,
                                  const char* arguments);

/**
 * Not 0: the calls of "structured-log" always collect the validity list. 0: only when it is due, as
 * in a new process.
 */
VESPRUN_EXPORT void vesprun_force_validity_list(int force);

/** Releases what `vesprun_call` returned. Null is allowed. */
VESPRUN_EXPORT void vesprun_free(char* text);

#ifdef __cplusplus
}
#endif

#endif

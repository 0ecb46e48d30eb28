#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <string>

#include "common/PropertyDict.h"
#include "common/RegistryHandle.h"

/// Marks what the shared library gives to other programs.
#define VESPRUN_EXPORT [[gnu::visibility("default")]]

// The entry points of vesprun for other programs: the storage controller's statistics as
// dictionaries, and the analytics events made of them.
//
// A program opens one `Device` and may then call the operations below, from one thread. None of
// them throws because of what a device holds or lacks. Dictionaries that are returned belong to the
// caller. Every operation opens its own connection to the storage controller and has closed it and
// released every registry handle when it returns, whatever happened. Failures are recorded as the
// first error text (`GetAPIErrorMessage`) where nothing else is said.
//
// Values are header-only; a program is built with the same C++ library and the same version of
// tsl::ordered_map as the shared library.

namespace vesprun {

/// The device that the program works on, for as long as it lives: one device directory and the
/// running Linux system. A process has one at a time; the entry points end the process when there
/// is none.
class Device {
 public:
  /// Reads the description of the device. Nothing, with a text in `error` that names the place,
  /// when the folder or its `device.json` cannot be used, or when another device is open. The
  /// device's time zone becomes that of the process, in the environment variable TZ.
  VESPRUN_EXPORT static std::unique_ptr<Device> open(const std::string& path, std::string& error);

  /// Writes what the device's services held back.
  VESPRUN_EXPORT ~Device();

  Device(const Device&) = delete;
  Device& operator=(const Device&) = delete;

 private:
  struct Installation;

  explicit Device(std::unique_ptr<Installation> installation);

  std::unique_ptr<Installation> _installation;
};

/// The first error text of the process, or "NA" when none has been recorded. By convention it
/// begins with the name of the operation that failed.
VESPRUN_EXPORT std::string GetAPIErrorMessage();

// The legacy NAND info: keys that begin with "com.quill.NANDInfo.", in a fixed order, to numbers of
// the type that their figure has: signed 32-bit for the driver version, unsigned 32-bit for the
// export version and the geometry, unsigned 64-bit for all others.

/// The legacy NAND info with its version fields and the purgeable space. On failure a dictionary
/// with "com.quill.NANDInfo.Error" and "com.quill.NANDInfo.ErrorMessage" instead.
VESPRUN_EXPORT PropertyDict CopyNANDInfo();

/// `CopyNANDInfo` for the daily log; empty on a day on which the statistics go to analytics events
/// alone, every other day (UTC). `options` is not consulted. Nothing when there is nothing to log.
VESPRUN_EXPORT std::optional<PropertyDict> CopyNANDInfoWithOptions(const PropertyDict& options);

/// Sets the legacy NAND info without its version fields in `info`, replacing what has the same
/// keys. Nothing happens on failure.
VESPRUN_EXPORT void DumpNANDInfo(PropertyDict& info);

/// The FTL fields of now with "HLT_APIErrorMessage", unfiltered. Nothing when `enabled` is 0 or on
/// failure.
VESPRUN_EXPORT std::optional<PropertyDict> CopyNANDFTLInfo(bool useStatKeyParser,
                                                           std::uint32_t enabled);

// The sets of storage statistics that may leave the device. Each is cut down to the fields of its
// table and, with `round`, its numbers keep the digits that the table gives. No operation fails as
// a whole: a set holds what could be had, and always "HLT_APIErrorMessage", the first error text of
// the process.

/// The FTL fields of now and the fields derived from them. Without the former the error text is all
/// there is.
VESPRUN_EXPORT PropertyDict CopyWhitelistedNANDFTLInfo(bool round);

/// Nothing. Other programs may look for it.
VESPRUN_EXPORT std::optional<PropertyDict> CopyWhitelistedNANDFTLCountersInfo();

/// The set of each MSP under its index ("0", "1" and so on), beside the error text. A set goes with
/// the fields derived for the storage as a whole and the 16-bit parts of the firmware's version,
/// "fw_version_identifier_0" (the lowest) to "fw_version_identifier_3", none of them rounded.
VESPRUN_EXPORT PropertyDict CopyWhitelistedNANDMSPInfo(bool round);

/// Six derived fields, each when it can be had, and the sizes and update counts of the stored
/// images, 0 where the service does not tell.
VESPRUN_EXPORT PropertyDict CopyWhitelistedStorageStats(bool round);

// A few figures on the storage's health, made from the FTL fields of now. Every key begins with
// "com.quill.NANDInfo.Health.", every value is a signed number: "MaxPercentageNANDUsed" and
// "MaxE2EErrors" of 32 bits and "HostReadErrors" of 64, at least 0; "NumGrownBadBlocks",
// "SpareAvailablePercent" and "NumDieFailures" of 64 bits, -1 when not known. None of them, with
// the error recorded, when the fields cannot be had.

/// For service plans, with "HLT_APIErrorMessage": everything but the spare blocks.
VESPRUN_EXPORT PropertyDict CopyTendmarkNANDInfo();

/// For updates over the air: everything but the spare blocks and the die failures. Empty when
/// nothing could be had.
VESPRUN_EXPORT PropertyDict CopyOTANANDInfo();

/// For labs, with "HLT_APIErrorMessage": everything but the die failures, and "IsNANDRetirable", 1
/// when the spare blocks are being used up or the expected life is over, else 0.
VESPRUN_EXPORT PropertyDict CopyInternalLabNANDInfo();

// What the stats magazine tells: snapshots of the FTL fields, one every four hours.

/// What happened between the stats-magazine snapshot of `hours` hours ago and the newest one.
///
/// With `deltaWanted` (not 0) the counters that accumulate are reported as what they grew by, or as
/// the old snapshot has them when no time lies between the two; without it always as the old one
/// has them. In any case as doubles, when `mode` is 0 or 2. The values that are instantaneous come
/// from the old snapshot unchanged, when `mode` is 1 or 2. With any other mode there are neither.
///
/// In this order: "com.quill.NANDInfo.IsStatMagSupported"; when both snapshots have a time stamp
/// "HLT_SM_deltaDays", a double, and the fields that both have, in the old one's order; the fields
/// derived from those of the newest snapshot; the average P/E cycles "of the period", doubles made
/// from the erase counters above and the partitions of now; "HLT_APIErrorMessage". When the newest
/// snapshot is missing, the old one's fields stand in place of the deltas.
VESPRUN_EXPORT PropertyDict CopySMagNANDFTLInfo(std::uint64_t hours, std::uint32_t deltaWanted,
                                                std::uint32_t mode);

/// The write amplification of garbage collection in each of the last six periods of four hours, the
/// latest first, told from the validity curve at the period's beginning: a double, or the 32-bit
/// number 0 for a period in which nothing was collected, or of which that is not known.
///
/// When the newest snapshot says that there is no stats magazine, the error text as
/// "com.quill.NANDInfo.ErrorMessage" instead. Else empty with `skipHistory` (not 0).
VESPRUN_EXPORT PropertyDict CopySMagNANDFTLCustomHistoryInfo(std::uint32_t skipHistory);

// Beside the statistics.

/// The bytes that the kernel's swap-out thread has written, as a kernel snapshot tells: the same
/// unsigned 64-bit number as "HLT_VMFreezer_bytesWritten" and
/// "com.quill.NANDInfo.VMFreezer.NumPhysicalWrites". It is 0 when the thread has no I/O statistics,
/// or too short ones to hold it. Empty when there is no snapshot, or no such thread in it.
VESPRUN_EXPORT PropertyDict CopyVMFreezerNANDInfo();

/// Does the storage controller recommend deleting content? False when it cannot be asked: most
/// controllers have no such method, and are not opened. Other failures are lines on the standard
/// error stream.
VESPRUN_EXPORT bool NandRecommendsContentDeletion();

/// Sends the storage statistics as analytics events, step by step from `firstStep` to 6, the last
/// one only with `allowMonthly`. Each step is told in the system log, at default level.
///
/// With `collectResults` (not 0) the payloads of all steps in one dictionary, later entries in
/// place of earlier ones of the same key: those of events that the service took, whether or not it
/// wanted them, and the NVRAM statistics. The MSPs' payloads are one entry, "msp_index", that of
/// the last MSP whose event was taken. "com.quill.NANDInfo.ErrorMessage" is the first error text of
/// the process. Otherwise nothing. The first argument is not consulted.
///
/// From step 7, which only has a name, that step's failure is recorded; from a later one nothing
/// is done.
VESPRUN_EXPORT std::optional<PropertyDict> NandInfoExtractToEH_runAllSteps(
    std::uint64_t context, bool allowMonthly, std::uint32_t collectResults,
    std::uint32_t firstStep);

struct nand_exporter_t;

/// A connection to the storage controller for other programs; theirs to keep between
/// `openORUConnection` and `closeORUConnection`.
struct ORUConnection {
  RegistryHandle service = 0;
  RegistryHandle connection = 0;
  nand_exporter_t* exporter = nullptr;
};

/// Opens the storage controller. False, with lines on the standard error stream and nothing left
/// open, when there is none, when it refuses, or when it offers no base statistics. `exporter` is
/// then the library's own entry for the controller's class; the connection's handle is written
/// there, too, and stays when the connection is closed.
VESPRUN_EXPORT bool openORUConnection(ORUConnection& connection);

/// Closes the record's connection and releases its service, if any, and forgets them.
VESPRUN_EXPORT void closeORUConnection(ORUConnection& connection);

}  // namespace vesprun

#pragma once

#include <sys/stat.h>

#include <optional>
#include <string>
#include <string_view>

#include "platform/host/files/Files.h"
#include "vesprun/Date.h"

namespace vesprun {

/// A file being written, as ".unfinished-RANDOM" until it is done. It appears under its final name
/// complete and durable, or not at all; destroying the object first drops it.
///
/// Files are readable and writable for their owner alone. Errors name the path and the cause.
class AtomicFile {
 public:
  /// The folder must exist.
  static std::optional<AtomicFile> create(const HostPath& folder, std::string& error);

  AtomicFile(AtomicFile&&) = default;
  AtomicFile& operator=(AtomicFile&&) = delete;
  ~AtomicFile();

  /// False when the bytes cannot be written; `replace` and `addNew` then fail with the same reason.
  bool append(std::string_view bytes);

  /// Owner, group and mode become those of a folder, without the rights to execute. Where the group
  /// cannot be given away, it has no rights.
  void takeAccessOf(const struct stat& folder);

  /// Instead of the time of the last write, if the file system can store it.
  void setModificationTime(const Date& time) { _modified = time; }

  /// Gives the document its name, replacing the file that has it, and removes left-overs. On
  /// failure the earlier file is still there, unless only making the new name durable failed.
  bool replace(const std::string& name, std::string& error);

  enum class Added { Done, NameTaken, Failed };

  /// Gives the document a name that is free. After `NameTaken` try another; only `Failed` sets
  /// `error`.
  Added addNew(const std::string& name, std::string& error);

 private:
  AtomicFile(HostPath folder, FileDescriptor descriptor)
      : _folder(std::move(folder)), _folderDescriptor(std::move(descriptor)) {}

  bool openUnfinished(std::string& error);
  bool writeOut(std::string_view bytes);
  bool makeDurable(const std::string& name, std::string& error);
  std::string pathOf(const std::string& name) const { return _folder.string() + '/' + name; }

  HostPath _folder;
  FileDescriptor _folderDescriptor;
  FileDescriptor _file;
  std::string _unfinishedName;  ///< empty after the document got its own name
  std::string _pending;         ///< not yet written
  std::string _failure;         ///< the first failure of `append`
  std::optional<Date> _modified;
};

/// Removes what killed processes left of their documents in a folder. To be called now and then
/// where documents only get new names.
void removeLeftOvers(const HostPath& folder);

/// Replaces the file at `path` with a whole document.
bool replaceFile(const HostPath& path, std::string_view content, std::string& error);

/// Makes the content of a file durable, and its name.
bool flushFile(const HostPath& path, std::string& error);

/// Flushes a directory (fsync), so that its names are durable.
bool flushFolder(const HostPath& folder, std::string& error);

}  // namespace vesprun

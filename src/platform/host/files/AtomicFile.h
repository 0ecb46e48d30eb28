#pragma once

#include <optional>
#include <string>
#include <string_view>

#include "common/Date.h"
#include "platform/host/files/FileDescriptor.h"

namespace vesprun {

/// A whole document on its way into a folder, written under the name ".unfinished-N". It appears
/// under its own name complete and durable, or not at all. What a process that was killed left
/// behind is written over by a later document.
///
/// Files are readable and writable for their owner alone. Dropping the object before it got a name
/// drops the document. Error texts name the path and the cause.
class AtomicFile {
 public:
  /// Starts an empty document in an existing folder.
  static std::optional<AtomicFile> create(const std::string& folder, std::string& error);

  AtomicFile(AtomicFile&& other) noexcept;
  AtomicFile& operator=(AtomicFile&&) = delete;
  ~AtomicFile();

  /// Appends the bytes. False when they cannot be written; the document can then no longer get a
  /// name, and `replace` and `addNew` repeat the reason.
  bool append(std::string_view bytes);

  /// Gives the document this modification time, where the file system can keep it, instead of the
  /// moment of its last byte.
  void setModificationTime(const Date& time) { _modified = time; }

  /// Gives the document its name in the folder, in place of the file that has it. False, with a
  /// text in `error`, when that failed: the earlier file is still there, unless only making the new
  /// name durable failed.
  bool replace(const std::string& name, std::string& error);

  enum class Added { Done, NameTaken, Failed };

  /// Gives the document a name that no file has yet. After `NameTaken` another name can be tried;
  /// only `Failed` sets `error`.
  Added addNew(const std::string& name, std::string& error);

 private:
  AtomicFile(std::string folder, FileDescriptor folderDescriptor);

  bool openUnfinished(std::string& error);
  bool writeOut(std::string_view bytes);
  bool makeDurable(const std::string& name, std::string& error);
  bool syncFolder(std::string& error) const;
  std::string pathOf(const std::string& name) const { return _folder + '/' + name; }

  std::string _folder;
  FileDescriptor _folderDescriptor;
  FileDescriptor _file;
  std::string _unfinishedName;  ///< empty when the document has its own name
  std::string _pending;         ///< bytes not handed to the kernel yet
  std::string _failure;         ///< the first reason why an `append` failed
  std::optional<Date> _modified;
};

/// Writes a whole document in place of the file at `path`, as `AtomicFile` does.
bool replaceFile(const std::string& path, std::string_view content, std::string& error);

/// Makes durable which names a folder has.
bool flushFolder(const std::string& folder, std::string& error);

}  // namespace vesprun

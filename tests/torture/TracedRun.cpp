#include "TracedRun.h"

#include <fcntl.h>
#include <signal.h>
#include <sys/mman.h>
#include <sys/ptrace.h>
#include <sys/syscall.h>
#include <sys/uio.h>
#include <sys/user.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <climits>
#include <cstring>
#include <map>
#include <set>
#include <span>
#include <stdexcept>

#if !defined(__x86_64__)
#error "torture changes system calls through the registers of x86-64"
#endif

namespace vesprun::torture {
namespace {

enum class Paths { None, Descriptor, First, AtFirst };

struct CallRow {
  int number;
  const char* name;
  Paths paths;
  std::vector<int> errors;
};

// Left out: what ends a process or a thread, waits, or only asks for numbers of the process.
const std::vector<CallRow>& callRows() {
  static const std::vector<CallRow> rows = {
      {SYS_access, "access", Paths::First, {EIO}},
      {SYS_openat, "openat", Paths::AtFirst, {EMFILE, EIO, ENOMEM}},
      {SYS_openat2, "openat2", Paths::AtFirst, {EMFILE, EIO, ENOMEM}},
      {SYS_read, "read", Paths::Descriptor, {EIO}},
      {SYS_pread64, "pread64", Paths::Descriptor, {EIO}},
      {SYS_write, "write", Paths::Descriptor, {ENOSPC, EIO}},
      {SYS_pwrite64, "pwrite64", Paths::Descriptor, {ENOSPC, EIO}},
      {SYS_fsync, "fsync", Paths::Descriptor, {EIO, ENOSPC}},
      {SYS_fdatasync, "fdatasync", Paths::Descriptor, {EIO}},
      {SYS_ftruncate, "ftruncate", Paths::Descriptor, {EIO, ENOSPC}},
      {SYS_lseek, "lseek", Paths::Descriptor, {EIO}},
      {SYS_newfstatat, "newfstatat", Paths::AtFirst, {EIO, ENOMEM}},
      {SYS_fstat, "fstat", Paths::Descriptor, {EIO}},
      {SYS_statfs, "statfs", Paths::First, {EIO}},
      {SYS_getdents64, "getdents64", Paths::Descriptor, {EIO}},
      {SYS_mkdir, "mkdir", Paths::First, {ENOSPC}},
      {SYS_mkdirat, "mkdirat", Paths::AtFirst, {ENOSPC}},
      {SYS_rename, "rename", Paths::First, {EIO}},
      {SYS_renameat, "renameat", Paths::AtFirst, {ENOSPC, EIO}},
      {SYS_renameat2, "renameat2", Paths::AtFirst, {ENOSPC}},
      {SYS_linkat, "linkat", Paths::AtFirst, {ENOSPC, EIO}},
      {SYS_unlink, "unlink", Paths::First, {EIO}},
      {SYS_unlinkat, "unlinkat", Paths::AtFirst, {EIO}},
      {SYS_fchmod, "fchmod", Paths::Descriptor, {EPERM}},
      {SYS_fchown, "fchown", Paths::Descriptor, {EPERM}},
      {SYS_flock, "flock", Paths::Descriptor, {ENOLCK}},
      {SYS_fcntl, "fcntl", Paths::Descriptor, {ENOLCK}},
      {SYS_close, "close", Paths::Descriptor, {EIO}},
      {SYS_mmap, "mmap", Paths::None, {ENOMEM}},
      {SYS_mremap, "mremap", Paths::None, {ENOMEM}},
      {SYS_brk, "brk", Paths::None, {ENOMEM}},
      {SYS_mprotect, "mprotect", Paths::None, {ENOMEM}},
      {SYS_clone3, "clone3", Paths::None, {EAGAIN}},
      {SYS_getrandom, "getrandom", Paths::None, {}},
      {SYS_uname, "uname", Paths::None, {}},
      {SYS_socket, "socket", Paths::None, {EMFILE}},
      {SYS_bind, "bind", Paths::None, {EADDRINUSE}},
      {SYS_listen, "listen", Paths::None, {EADDRINUSE}},
      {SYS_accept4, "accept4", Paths::None, {EMFILE}},
      {SYS_sendto, "sendto", Paths::None, {EPIPE}},
      {SYS_recvfrom, "recvfrom", Paths::None, {ECONNRESET}},
      {SYS_poll, "poll", Paths::None, {ENOMEM}},
      {SYS_ppoll, "ppoll", Paths::None, {ENOMEM}},
  };
  return rows;
}

const CallRow* rowOf(int number) {
  const auto row = std::ranges::find(callRows(), number, &CallRow::number);
  return row == callRows().end() ? nullptr : &*row;
}

std::string linkTarget(const std::string& link) {
  char target[PATH_MAX];
  const ssize_t length = readlink(link.c_str(), target, sizeof target);
  return length > 0 ? std::string(target, static_cast<std::size_t>(length)) : std::string();
}

std::string descriptorPath(pid_t process, std::uint64_t descriptor) {
  const std::string folder = "/proc/" + std::to_string(process);
  return static_cast<int>(descriptor) == AT_FDCWD
             ? linkTarget(folder + "/cwd")
             : linkTarget(folder + "/fd/" + std::to_string(descriptor));
}

/// What lies at the address in the traced process, as far as it can be read.
std::string_view bytesAt(pid_t process, std::uint64_t address, std::span<char> buffer) {
  const iovec local{buffer.data(), buffer.size()};
  const iovec remote{reinterpret_cast<void*>(address), buffer.size()};  // NOLINT
  const ssize_t got = process_vm_readv(process, &local, 1, &remote, 1, 0);
  return {buffer.data(), static_cast<std::size_t>(std::max<ssize_t>(got, 0))};
}

std::string textAt(pid_t process, std::uint64_t address) {
  std::string text;
  char buffer[64];
  while (text.size() < PATH_MAX) {
    // Up to the end of the page: the next one may not be there.
    const std::size_t wanted = std::min<std::uint64_t>(sizeof buffer, 4096 - address % 4096);
    const std::string_view piece = bytesAt(process, address, std::span(buffer).first(wanted));
    text.append(piece.substr(0, piece.find('\0')));
    if (piece.empty() || piece.find('\0') != piece.npos) {
      break;
    }
    address += piece.size();
  }
  return text;
}

/// Of a call that opens a file.
std::uint64_t openingFlags(pid_t process, const user_regs_struct& registers) {
  std::uint64_t flags = registers.orig_rax == SYS_openat ? registers.rdx : 0;
  if (registers.orig_rax == SYS_openat2) {
    char first[sizeof flags] = {};
    bytesAt(process, registers.rdx, first);
    std::memcpy(&flags, first, sizeof flags);
  }
  return flags;
}

std::string pathAt(pid_t process, std::uint64_t folder, std::uint64_t address) {
  std::string path = textAt(process, address);
  if (path.empty()) {
    return descriptorPath(process, folder);
  }
  return path.front() == '/' ? path : descriptorPath(process, folder) + '/' + path;
}

/// Which bytes and names would be lost if the power went now.
class Durability {
 public:
  explicit Durability(std::string folder) : _folder(std::move(folder)) {}

  void written(const std::string& path) { addTo(_bytes, path); }
  void made(const std::string& path) { addTo(_names, path); }
  void flushed(const std::string& path) {
    _bytes.erase(path);
    std::erase_if(_names, [&path](const std::string& name) { return folderOf(name) == path; });
  }
  void named(const std::string& from, const std::string& to) {
    if (_bytes.erase(from) > 0) {
      _faults.push_back(to + " got its name before its bytes were flushed");
    }
    _names.erase(from);
    made(to);
  }
  void removed(const std::string& path) {
    _bytes.erase(path);
    _names.erase(path);
    if (path.ends_with("-journal")) {  // its end is the end of the transaction
      made(path);
    }
    // What goes, and what is remembered of it.
    static const std::pair<const char*, const char*> order[] = {
        {"/outbox/logs/0", "/outbox/pruned.jsonl"},
        {"/outbox/logs/0", kNumberFile},
        {"/kernel/ecc/", "/outbox/records.jsonl"},
    };
    for (const auto& [goes, stays] : order) {
      const std::string note = _folder + stays;
      if (path.starts_with(_folder + goes) &&
          (_bytes.contains(note) || _names.contains(note) || _names.contains(folderOf(note)))) {
        _faults.push_back(path + " went before " + stays + " was flushed");
      }
    }
  }

  std::vector<std::string> atTheEnd() {
    // Lines are appended without waiting for the disk, and the number is found again by the logs.
    const auto canGo = [this](const std::string& path) {
      return path == _folder + kNumberFile ||
             (path.ends_with(".jsonl") && !path.ends_with("/pruned.jsonl"));
    };
    for (const auto& [paths, what] :
         {std::pair(&_bytes, " was written and never flushed"),
          {&_names, " is a name made or removed whose folder was never flushed"}}) {
      for (const std::string& path : *paths) {
        if (!canGo(path)) {
          _faults.push_back(path + what);
        }
      }
    }
    return _faults;
  }

 private:
  static constexpr const char* kNumberFile = "/outbox/.log-number";
  static std::string folderOf(const std::string& path) { return path.substr(0, path.rfind('/')); }

  void addTo(std::set<std::string>& paths, const std::string& path) {
    if (path.starts_with(_folder + '/')) {
      paths.insert(path);
    }
  }

  std::string _folder;
  std::set<std::string> _bytes;
  std::set<std::string> _names;
  std::vector<std::string> _faults;
};

class TimeLimit {
 public:
  TimeLimit() {
    _expired = 0;
    struct sigaction action {};
    action.sa_handler = [](int) { _expired = 1; };
    sigaction(SIGALRM, &action, nullptr);
    alarm(kMaxRunSeconds);
  }
  TimeLimit(const TimeLimit&) = delete;
  TimeLimit& operator=(const TimeLimit&) = delete;
  ~TimeLimit() { alarm(0); }
  static bool expired() { return _expired != 0; }

 private:
  static inline volatile sig_atomic_t _expired = 0;
};

user_regs_struct registersOf(pid_t thread) {
  user_regs_struct registers{};
  ptrace(PTRACE_GETREGS, thread, nullptr, &registers);
  return registers;
}

void setRegisters(pid_t thread, user_regs_struct& registers) {
  ptrace(PTRACE_SETREGS, thread, nullptr, &registers);
}

Call callOf(pid_t thread, const user_regs_struct& registers) {
  Call call{static_cast<int>(registers.orig_rax), {}, false, 0};
  const CallRow* row = rowOf(call.number);
  switch (row == nullptr ? Paths::None : row->paths) {
    case Paths::None:
      break;
    case Paths::Descriptor:
      call.path = descriptorPath(thread, registers.rdi);
      break;
    case Paths::First:
      call.path = pathAt(thread, static_cast<std::uint64_t>(AT_FDCWD), registers.rdi);
      break;
    case Paths::AtFirst:
      call.path = pathAt(thread, registers.rdi, registers.rsi);
      break;
  }
  return call;
}

class Tracer {
 public:
  Tracer(pid_t child, const std::string& folder, const Fault& fault)
      : _child(child), _folder(folder), _fault(fault), _durability(folder) {}

  /// Follows the program to its end.
  Outcome run() {
    const TimeLimit limit;
    while (true) {
      int status = 0;
      const pid_t thread = waitpid(-_child, &status, __WALL);
      if (thread < 0) {
        if (errno == EINTR && TimeLimit::expired()) {
          _outcome.late = true;
          kill(_child, SIGKILL);
          continue;
        }
        if (errno == EINTR) {
          continue;
        }
        break;
      }
      if (WIFEXITED(status) || WIFSIGNALED(status)) {
        if (thread == _child) {
          _outcome.status = WIFEXITED(status) ? WEXITSTATUS(status) : -1;
          _outcome.signal = WIFSIGNALED(status) ? WTERMSIG(status) : 0;
          break;
        }
        continue;
      }
      int signal = WSTOPSIG(status);
      if (signal == (SIGTRAP | 0x80)) {
        __ptrace_syscall_info info{};
        ptrace(PTRACE_GET_SYSCALL_INFO, thread, sizeof info, &info);
        if (info.op == PTRACE_SYSCALL_INFO_ENTRY) {
          atEntry(thread);
        } else if (info.op == PTRACE_SYSCALL_INFO_EXIT) {
          atExit(thread);
        }
        signal = 0;
      } else if (status >> 16 != 0 || signal == SIGSTOP || signal == SIGTRAP) {
        signal = 0;  // a new thread, or the program's start
      }
      ptrace(isOver(thread) ? PTRACE_CONT : PTRACE_SYSCALL, thread, nullptr, signal);
    }
    _outcome.notDurable = _durability.atTheEnd();
    return std::move(_outcome);
  }

 private:
  /// A thread's call between its entry and its exit.
  struct Pending {
    int number;
    int error;         ///< the answer, when the call is not made
    std::string from;  ///< of a call that gives a name: paths as they were before it
    std::string to;
    bool makes;  ///< a name that was not there
  };

  /// The fault has happened, and no further call of the thread is changed.
  bool isOver(pid_t thread) {
    return _outcome.happened && !_fault.lasts && _fault.kind != Fault::Kind::DiskFull &&
           _pending[thread].error == 0;
  }

  void atEntry(pid_t thread) {
    user_regs_struct registers = registersOf(thread);
    Pending& pending = _pending[thread];
    pending = {static_cast<int>(registers.orig_rax), 0, {}, {}, false};
    _count += !_fault.ofItsKind || pending.number == _fault.number ? 1 : 0;
    if (_fault.kind == Fault::Kind::None) {
      record(thread, registers, pending);
      return;
    }
    if (_fault.kind == Fault::Kind::DiskFull) {
      limitGrowth(thread, registers, pending);
      return;
    }
    if (_count < _fault.call || (_outcome.happened && !_fault.lasts) ||
        (_fault.number >= 0 && _fault.number != pending.number)) {
      return;
    }
    if (_outcome.place.empty()) {
      const Call call = callOf(thread, registers);
      const bool looks = (openingFlags(thread, registers) & O_PATH) != 0;
      _outcome.place = (looks ? "look at " : nameOfCall(call.number) + ' ') + call.path;
    }
    if (_fault.kind == Fault::Kind::Error) {
      replaceCall(thread, registers, pending, _fault.error);
    } else if (_fault.kind == Fault::Kind::Short) {
      shorten(thread, registers, std::max<std::uint64_t>(registers.rdx / 2, 1));
    } else if (_fault.kind == Fault::Kind::Kill) {
      kill(_child, SIGKILL);
      _outcome.happened = true;
    } else {
      _fault.whilePaused();
      _outcome.happened = true;
    }
  }

  void atExit(pid_t thread) {
    user_regs_struct registers = registersOf(thread);
    Pending& pending = _pending[thread];
    if (pending.error != 0) {
      // A program break that cannot grow is answered by the one that was.
      registers.rax =
          pending.number == SYS_brk ? _break : static_cast<unsigned long long>(-pending.error);
      setRegisters(thread, registers);
      pending.error = 0;
    } else if (pending.number == SYS_brk) {
      _break = registers.rax;
    } else if (_fault.kind == Fault::Kind::None && static_cast<long long>(registers.rax) >= 0) {
      switch (pending.number) {
        case SYS_write:
        case SYS_pwrite64:
          _durability.written(pending.from);
          break;
        case SYS_fsync:
        case SYS_fdatasync:
          _durability.flushed(pending.from);
          break;
        case SYS_rename:
        case SYS_renameat:
        case SYS_renameat2:
        case SYS_linkat:
          _durability.named(pending.from, pending.to);
          break;
        case SYS_mkdir:
        case SYS_mkdirat:
        case SYS_openat:
        case SYS_openat2:
          if (pending.makes) {
            _durability.made(pending.from);
          }
          break;
        case SYS_unlink:
        case SYS_unlinkat:
          _durability.removed(pending.from);
          break;
        default:
          break;
      }
    }
  }

  void record(pid_t thread, const user_regs_struct& registers, Pending& pending) {
    Call call = callOf(thread, registers);
    pending.from = call.path;
    static const std::set<int> changing = {SYS_write,     SYS_pwrite64,  SYS_fsync,   SYS_fdatasync,
                                           SYS_ftruncate, SYS_mkdir,     SYS_mkdirat, SYS_rename,
                                           SYS_renameat,  SYS_renameat2, SYS_linkat,  SYS_unlink,
                                           SYS_unlinkat};
    call.changes =
        call.path.starts_with(_folder + '/') &&
        (changing.contains(call.number) || (openingFlags(thread, registers) & O_CREAT) != 0);
    call.size = call.changes && transfersBytes(call.number) ? registers.rdx : 0;
    pending.makes = call.changes && access(call.path.c_str(), F_OK) != 0;
    if (pending.number == SYS_renameat || pending.number == SYS_renameat2 ||
        pending.number == SYS_linkat) {
      pending.to = pathAt(thread, registers.rdx, registers.r10);
    } else if (pending.number == SYS_rename) {
      pending.to = pathAt(thread, static_cast<std::uint64_t>(AT_FDCWD), registers.rsi);
    }
    _outcome.calls.push_back(std::move(call));
  }

  void limitGrowth(pid_t thread, user_regs_struct& registers, Pending& pending) {
    if ((pending.number != SYS_write && pending.number != SYS_pwrite64) ||
        !descriptorPath(thread, registers.rdi).starts_with(_folder + '/')) {
      return;
    }
    const std::uint64_t left = _fault.room - _grown;
    const std::uint64_t wanted = registers.rdx;
    if (left == 0) {
      replaceCall(thread, registers, pending, ENOSPC);
    } else if (wanted > left) {
      shorten(thread, registers, left);
    }
    _grown += std::min(wanted, left);
  }

  void replaceCall(pid_t thread, user_regs_struct& registers, Pending& pending, int error) {
    pending.error = error;
    _outcome.happened = true;
    if (pending.number != SYS_close) {  // which closes, whatever it answers
      registers.orig_rax = static_cast<unsigned long long>(-1);
      setRegisters(thread, registers);
    }
  }

  void shorten(pid_t thread, user_regs_struct& registers, std::uint64_t size) {
    registers.rdx = size;
    setRegisters(thread, registers);
    _outcome.happened = true;
  }

  pid_t _child;
  std::string _folder;
  const Fault& _fault;
  Durability _durability;
  Outcome _outcome;
  std::size_t _count = 0;
  std::uint64_t _grown = 0;
  std::uint64_t _break = 0;
  std::map<pid_t, Pending> _pending;
};

}  // namespace

TextFile::TextFile(const std::string& text) : _file(memfd_create("text", MFD_CLOEXEC)) {
  if (_file < 0 ||
      pwrite(_file, text.data(), text.size(), 0) != static_cast<ssize_t>(text.size())) {
    throw std::runtime_error("no temporary file can be made");
  }
}

TextFile::~TextFile() { close(_file); }

std::string TextFile::text() const {
  std::string text(static_cast<std::size_t>(std::max<off_t>(lseek(_file, 0, SEEK_END), 0)), ' ');
  const ssize_t got = pread(_file, text.data(), text.size(), 0);
  text.resize(static_cast<std::size_t>(std::max<ssize_t>(got, 0)));
  return text;
}

pid_t start(const std::vector<std::string>& command, const std::string& folder, int output,
            int errors, bool isTraced) {
  std::vector<char*> arguments;
  for (const std::string& argument : command) {
    arguments.push_back(const_cast<char*>(argument.c_str()));  // NOLINT: execve changes nothing
  }
  arguments.push_back(nullptr);
  std::vector<char*> variables;
  for (char** variable = environ; *variable != nullptr; ++variable) {
    variables.push_back(*variable);
  }
  std::string pad = "MALLOC_TOP_PAD_=0";  // more often a call for memory that can fail
  if (isTraced) {
    variables.push_back(pad.data());
  }
  variables.push_back(nullptr);
  // A fork would copy the tables of all the memory that this process has.
  const pid_t child = vfork();
  if (child == 0) {
    // A group of its own: other children of this process are not the tracer's.
    if (dup2(output, STDOUT_FILENO) >= 0 && dup2(errors, STDERR_FILENO) >= 0 &&
        setpgid(0, 0) == 0 && chdir(folder.c_str()) == 0 &&
        (!isTraced || ptrace(PTRACE_TRACEME, 0, nullptr, nullptr) == 0)) {
      alarm(isTraced ? 0 : kMaxRunSeconds);
      execve(arguments[0], arguments.data(), variables.data());
    }
    _exit(126);
  }
  if (child < 0) {
    throw std::runtime_error("vfork: " + std::string(std::strerror(errno)));
  }
  return child;
}

Outcome runTraced(const std::vector<std::string>& command, const std::string& folder,
                  const Fault& fault) {
  const TextFile output;
  const TextFile errors;
  const pid_t child = start(command, folder, output.descriptor(), errors.descriptor(), true);
  int status = 0;
  waitpid(child, &status, 0);  // the program's start
  if (!WIFSTOPPED(status) || ptrace(PTRACE_SETOPTIONS, child, nullptr,
                                    PTRACE_O_TRACESYSGOOD | PTRACE_O_TRACECLONE |
                                        PTRACE_O_TRACEEXEC | PTRACE_O_EXITKILL) != 0) {
    throw std::runtime_error(command.front() + " cannot be started and traced");
  }
  ptrace(PTRACE_SYSCALL, child, nullptr, 0);
  Outcome outcome = Tracer(child, folder, fault).run();
  outcome.standardError = errors.text();
  return outcome;
}

const std::vector<int>& fittingErrors(int number) {
  static const std::vector<int> none;
  const CallRow* row = rowOf(number);
  return row == nullptr ? none : row->errors;
}

bool transfersBytes(int number) {
  return number == SYS_read || number == SYS_pread64 || number == SYS_write ||
         number == SYS_pwrite64;
}

std::string nameOfCall(int number) {
  const CallRow* row = rowOf(number);
  return row == nullptr ? "call " + std::to_string(number) : row->name;
}

}  // namespace vesprun::torture

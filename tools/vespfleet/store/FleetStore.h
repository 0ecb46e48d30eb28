#pragma once

#include <array>
#include <cstdint>
#include <functional>
#include <limits>
#include <optional>
#include <span>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

#include "ExportedLine.h"

namespace vesprun {

/// Why a store cannot do what it was asked: one line that names the store.
class StoreFailure : public std::runtime_error {
 public:
  using std::runtime_error::runtime_error;
};

/// Both ends are included.
struct DayRange {
  std::int32_t from = std::numeric_limits<std::int32_t>::min();
  std::int32_t to = std::numeric_limits<std::int32_t>::max();
};

enum class KeyKind { Scalar, Distribution };

/// The member of a line by which a question parts the devices.
enum class Member { None, Build, Model, Whitelist };

using MemberText = std::optional<std::string>;  ///< null sorts first

/// A key, and on how many devices and days it was reported.
struct ReportedKey {
  std::string key;
  KeyKind kind = KeyKind::Scalar;
  std::uint64_t devices = 0;
  std::uint64_t days = 0;
};

/// A question about one key.
struct Question {
  std::string key;
  DayRange days;
  Member by = Member::None;
  bool total = false;       ///< all days together
  std::uint64_t least = 0;  ///< an answer over fewer devices only counts them
};

/// What devices an answer is about.
struct AnsweredGroup {
  std::int32_t from = 0;  ///< the first day, or the only one
  std::int32_t to = 0;
  std::uint64_t deviceDays = 0;
  std::uint64_t devices = 0;
  MemberText member;
};

struct ScalarAnswer {
  AnsweredGroup group;
  std::optional<Summary> summary;  ///< nothing of too few devices
};

struct DistributionAnswer {
  AnsweredGroup group;
  std::optional<Statistics> statistics;  ///< nothing of too few devices
  std::optional<Histogram> histogram;
};

/// For each of two groups of devices, the means of each device's values over the days.
struct KeySpreads {
  std::string key;
  KeyKind kind = KeyKind::Scalar;
  std::array<Spread, 2> groups;
};

struct ComparedGroups {
  Member by = Member::Build;
  std::array<std::string, 2> values;
  DayRange days;
  std::string prefix;  ///< of keys
};

/// A line as it was stored, without digest.
using VisitLine = std::function<void(const ExportedLine& line)>;

/// What became of a line that a store was given.
enum class Outcome { New, Replaced, Repeated, Older, Refused };
inline constexpr std::size_t kOutcomes = 5;
using Outcomes = std::array<std::uint64_t, kOutcomes>;  ///< how many lines became what

/// What was removed.
struct Removal {
  std::uint64_t lines = 0;
  std::optional<std::int32_t> firstDay;  ///< the earliest that is still taken
};

inline constexpr int kMinLeast = 3;
inline constexpr int kUsualLeast = 5;

/// What many devices reported. For each device and day one line is current: that of the highest
/// revision; of equal revisions the one created later; then the one with the greater digest. The
/// others are never seen. Order and repetition of lines make no difference.
///
/// Every operation throws `StoreFailure`.
class FleetStore {
 public:
  virtual ~FleetStore() = default;

  /// Answers over fewer devices are only counted.
  virtual std::uint64_t least() = 0;

  /// Takes a line. It is stored whole or not at all, and durable once `finish` has returned.
  virtual void add(const ExportedLine& line) = 0;
  virtual void finish() = 0;
  /// Of the lines that were added, once `finish` has returned.
  const Outcomes& outcomes() const { return _outcomes; }

  using VisitKey = std::function<void(const ReportedKey& key)>;
  using VisitDevices =
      std::function<void(std::int32_t day, const MemberText& member, std::uint64_t devices)>;
  using VisitScalar = std::function<void(const ScalarAnswer& answer)>;
  using VisitDistribution = std::function<void(const DistributionAnswer& answer)>;
  using VisitSpreads = std::function<void(KeySpreads&& spreads)>;

  /// The keys of the current lines, by their bytes, a scalar before a distribution.
  virtual void visitKeys(const VisitKey& visit) = 0;
  virtual bool hasKey(std::string_view key, KeyKind kind) = 0;
  virtual bool hasMember(Member by, const std::string& value) = 0;
  /// How many devices have a day as their last, by day and then by the last line's member.
  virtual void visitLastDays(Member by, const VisitDevices& visit) = 0;
  /// Answers by day and then by the text of the member. A key that the store does not have is a
  /// failure.
  void answerScalar(const Question& question, const VisitScalar& visit);
  void answerDistribution(const Question& question, const VisitDistribution& visit);
  /// The keys that begin so and that devices of both groups have.
  virtual void visitSpreads(const ComparedGroups& groups, const VisitSpreads& visit) = 0;
  /// The current lines of those days with the keys that begin with `prefix`, by day.
  virtual void visitLines(const DayRange& days, const std::string& prefix,
                          const VisitLine& visit) = 0;

  /// Removes all that devices sent, and refuses their lines from then on.
  virtual Removal forget(std::span<const std::string> devices) = 0;
  /// Removes the lines of more than `days` days before the newest day that enough devices have and
  /// that is not after `latest`, and refuses such lines from then on.
  virtual Removal prune(std::int32_t days, std::int32_t latest) = 0;

 protected:
  virtual void visitScalars(const Question& question, const VisitScalar& visit) = 0;
  virtual void visitDistributions(const Question& question, const VisitDistribution& visit) = 0;
  void clearOutcomes() { _outcomes = {}; }
  void count(Outcome outcome) { ++_outcomes[static_cast<std::size_t>(outcome)]; }

 private:
  void requireKey(const std::string& key, KeyKind kind);

  Outcomes _outcomes{};
};

enum class StoreUse { Ask, Change, Load };

}  // namespace vesprun

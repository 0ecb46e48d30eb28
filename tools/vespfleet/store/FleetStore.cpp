#include "FleetStore.h"

#include "clickhouse/ClickHouseStore.h"
#include "sqlite/SqliteStore.h"

namespace vesprun {
namespace {

/// Passes answers on to `visit`, and notes that there was one.
template <typename Visit>
auto noting(bool& isAnswered, const Visit& visit) {
  return [&](const auto& answer) {
    isAnswered = true;
    visit(answer);
  };
}

}  // namespace

std::string storeFault(const std::string& address) {
  const std::size_t scheme = address.find("://");
  if (address.starts_with("http://") || address.starts_with("https://")) {
    return ClickHouseServer::faultOf(address);
  }
  const bool isScheme =
      scheme != std::string::npos && scheme != 0 &&
      address.find_first_not_of(
          "abcdefghijklmnopqrstuvwxyzABCDEFGHIJKLMNOPQRSTUVWXYZ0123456789+.-") == scheme;
  return isScheme ? "a store is an SQLite file, http://HOST:PORT/DATABASE or https://..." : "";
}

std::unique_ptr<FleetStore> openFleetStore(const std::string& address, StoreUse use,
                                           std::optional<int> least) {
  if (address.starts_with("http://") || address.starts_with("https://")) {
    return std::make_unique<ClickHouseStore>(address, use, least);
  }
  return std::make_unique<SqliteStore>(address, use, least);
}

void FleetStore::answerScalar(const Question& question, const VisitScalar& visit) {
  bool isAnswered = false;
  visitScalars(question, noting(isAnswered, visit));
  if (!isAnswered) {
    requireKey(question.key, KeyKind::Scalar);
  }
}

void FleetStore::answerDistribution(const Question& question, const VisitDistribution& visit) {
  bool isAnswered = false;
  visitDistributions(question, noting(isAnswered, visit));
  if (!isAnswered) {
    requireKey(question.key, KeyKind::Distribution);
  }
}

void FleetStore::requireKey(const std::string& key, KeyKind kind) {
  const bool isScalar = kind == KeyKind::Scalar;
  if (!hasKey(key, kind)) {
    const bool isOther = hasKey(key, isScalar ? KeyKind::Distribution : KeyKind::Scalar);
    throw StoreFailure(key + ": " + (isOther ? "is a " : "the store has no such ") +
                       (isScalar == isOther ? "distribution" : "scalar"));
  }
}

}  // namespace vesprun

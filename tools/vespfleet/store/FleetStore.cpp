#include "FleetStore.h"

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

#include "Printing.h"

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <iostream>

#include "commandline/Arguments.h"
#include "platform/host/documents/QuotedText.h"

namespace vesprun {
namespace {

std::string numberText(double number) {
  char text[32];
  std::snprintf(text, sizeof text, "%.6g", number);
  return text;
}

JsonLine jsonOf(const MemberText& member) { return member ? JsonLine(*member) : JsonLine(); }

/// The members that say what an answer is about.
JsonLine beginLine(const AnsweredGroup& group, const Question& question) {
  JsonLine line;
  if (question.total) {
    line["from"] = group.from;
    line["to"] = group.to;
    line["deviceDays"] = group.deviceDays;
  } else {
    line["day"] = group.from;
  }
  if (question.by != Member::None) {
    line[nameOf(question.by)] = jsonOf(group.member);
  }
  line["devices"] = group.devices;
  return line;
}

std::vector<std::string> titlesOf(const Question& question) {
  std::vector<std::string> titles{question.total ? "days" : "day"};
  if (question.by != Member::None) {
    titles.emplace_back(nameOf(question.by));
  }
  titles.emplace_back("devices");
  return titles;
}

std::vector<std::string> beginRow(const AnsweredGroup& group, const Question& question) {
  std::vector<std::string> row{dateOfDay(group.from)};
  if (question.total) {
    row.front() += " to " + dateOfDay(group.to);
  }
  if (question.by != Member::None) {
    row.push_back(group.member.value_or("none"));
  }
  row.push_back(std::to_string(group.devices));
  return row;
}

}  // namespace

Results::~Results() {
  if (_json || _rows.size() < 2) {
    return;
  }
  std::vector<std::size_t> widths;
  for (const auto& row : _rows) {
    widths.resize(std::max(widths.size(), row.size()));
    for (std::size_t i = 0; i < row.size(); ++i) {
      widths[i] = std::max(widths[i], row[i].size());
    }
  }
  for (const auto& row : _rows) {
    std::string line;
    for (std::size_t i = 0; i < row.size(); ++i) {
      line += row[i];
      if (i + 1 < row.size()) {
        line.append(widths[i] - row[i].size() + 2, ' ');
      }
    }
    std::cout << line << '\n';
  }
}

void Results::print(const JsonLine& line) {
  std::cout << line.dump(-1, ' ', false, JsonLine::error_handler_t::replace) << '\n';
}

void Results::addRow(std::vector<std::string> cells) {
  for (std::string& cell : cells) {
    cell = printableText(cell);
  }
  _rows.push_back(std::move(cells));
}

const char* nameOf(Member by) {
  return by == Member::Build ? "build" : by == Member::Model ? "model" : "whitelist";
}

void printScalars(FleetStore& store, const Question& question, bool json) {
  std::vector<std::string> titles = titlesOf(question);
  titles.emplace_back("mean");
  for (const int percent : kPercents) {
    titles.push_back(std::to_string(percent) + " %");
  }
  Results results(std::move(titles), json);
  store.answerScalar(question, [&](const ScalarAnswer& answer) {
    if (json) {
      JsonLine line = beginLine(answer.group, question);
      if (answer.summary) {
        JsonLine quantiles;
        for (std::size_t i = 0; i < std::size(kPercents); ++i) {
          const auto& quantile = answer.summary->quantiles[i];
          quantiles[JsonLine(kPercents[i] / 100.0).dump()] =
              quantile ? JsonLine(*quantile) : JsonLine();
        }
        line["mean"] = answer.summary->mean;
        line["quantiles"] = std::move(quantiles);
      }
      results.print(line);
      return;
    }
    std::vector<std::string> row = beginRow(answer.group, question);
    if (answer.summary) {
      row.push_back(numberText(answer.summary->mean));
      for (const auto& quantile : answer.summary->quantiles) {
        row.push_back(quantile ? std::to_string(*quantile) : "-");
      }
    } else {
      row.emplace_back("too few devices");
    }
    results.addRow(std::move(row));
  });
}

void printDistributions(FleetStore& store, const Question& question, bool json) {
  std::vector<std::string> titles = titlesOf(question);
  titles.insert(titles.end(), {"values", "mean", "deviation", "histogram"});
  Results results(std::move(titles), json);
  store.answerDistribution(question, [&](const DistributionAnswer& answer) {
    bool overlap = false;
    std::vector<std::string> labels;
    if (answer.histogram) {
      labels = labelsInOrder(*answer.histogram, overlap);
    }
    if (json) {
      JsonLine line = beginLine(answer.group, question);
      if (answer.statistics) {
        line["statistics"] = {{"count", answer.statistics->count},
                              {"mean", answer.statistics->mean},
                              {"deviations", answer.statistics->deviations}};
        JsonLine& histogram = line["histogram"];
        if (answer.histogram) {
          histogram = JsonLine::object();
          for (const std::string& label : labels) {
            histogram[label] = answer.histogram->at(label);
          }
        }
        if (overlap) {
          line["overlaps"] = true;
        }
      }
      results.print(line);
      return;
    }
    std::vector<std::string> row = beginRow(answer.group, question);
    if (answer.statistics) {
      const auto count = static_cast<double>(answer.statistics->count);
      row.push_back(std::to_string(answer.statistics->count));
      row.push_back(numberText(answer.statistics->mean));
      row.push_back(numberText(std::sqrt(std::max(0.0, answer.statistics->deviations) / count)));
      std::string histogram;
      for (const std::string& label : labels) {
        histogram += (histogram.empty() ? "" : "  ") + label + ": " +
                     std::to_string(answer.histogram->at(label));
      }
      row.push_back(histogram + (overlap ? "  (buckets overlap)" : ""));
    } else {
      row.emplace_back("too few devices");
    }
    results.addRow(std::move(row));
  });
}

void printComparison(const std::vector<ComparedKey>& keys, bool json) {
  constexpr std::size_t kShown = 20;
  {
    Results results(
        {"key", "kind", "devices A", "devices B", "mean A", "mean B", "difference", "p", "q"},
        json);
    for (const ComparedKey& key : keys) {
      const char* const kind = key.kind == KeyKind::Scalar ? "scalar" : "distribution";
      const double difference = key.meanB - key.meanA;
      const double relative = difference / std::abs(key.meanA);
      const bool hasRelative = std::isfinite(relative);
      if (json) {
        results.print({{"key", key.key},
                       {"kind", kind},
                       {"devicesA", key.devicesA},
                       {"devicesB", key.devicesB},
                       {"meanA", key.meanA},
                       {"meanB", key.meanB},
                       {"difference", difference},
                       {"relative", hasRelative ? JsonLine(relative) : JsonLine()},
                       {"p", key.p},
                       {"q", key.q}});
      } else if (static_cast<std::size_t>(&key - keys.data()) < kShown) {
        results.addRow({key.key, kind, std::to_string(key.devicesA), std::to_string(key.devicesB),
                        numberText(key.meanA), numberText(key.meanB),
                        numberText(difference) +
                            (hasRelative ? " (" + numberText(relative * 100) + " %)" : ""),
                        numberText(key.p), numberText(key.q)});
      }
    }
  }
  if (!json) {
    std::cout << keys.size() << (keys.size() == 1 ? " key" : " keys") << " compared"
              << (keys.size() > kShown ? ", the first 20 shown" : "")
              << ". Of all keys with a q of at most 0.05, about one in twenty differs by chance\n"
                 "alone.\n";
  }
}

}  // namespace vesprun

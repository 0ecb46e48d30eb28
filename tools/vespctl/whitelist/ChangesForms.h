#pragma once

#include <string>

#include "whitelist/WhitelistChanges.h"

namespace vesprun {

/// Written without a tree of JSON values, which would cost more than the comparison.
std::string jsonText(const WhitelistChanges& changes);

/// For people, what lets more out first.
void printChanges(const WhitelistChanges& changes);

/// The same as a table in Markdown. No text of the documents can act as markup.
void printChangesAsMarkdown(const WhitelistChanges& changes);

}  // namespace vesprun

#pragma once

#include "platform/host/documents/JsonForm.h"
#include "whitelist/WhitelistChanges.h"

namespace vesprun {

Json jsonOf(const WhitelistChanges& changes);

/// For people, what lets more out first.
void printChanges(const WhitelistChanges& changes);

/// The same as a table in Markdown. No text of the documents can act as markup.
void printChangesAsMarkdown(const WhitelistChanges& changes);

}  // namespace vesprun

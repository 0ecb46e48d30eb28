#pragma once

/// Visible to users of the shared library.
#define VESPRUN_EXPORT [[gnu::visibility("default")]]

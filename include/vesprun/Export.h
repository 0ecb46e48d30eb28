#pragma once

/// Marks what the shared library gives to other programs.
#define VESPRUN_EXPORT [[gnu::visibility("default")]]

#pragma once

/* Marks what the shared library gives to other programs, in C and C++. */
#define VESPRUN_EXPORT __attribute__((visibility("default")))

#pragma once
// Executable memory that starts out filled with the breakpoint byte 0xCC, for import stubs.

#include <stddef.h>

// A private read-write-execute mapping of `bytes` bytes that all read 0xCC, or MAP_FAILED (all
// ones). Pages are copy-on-write views of 0xCC pages in this program's own file, so a load costs
// no fill and only the pages a module writes become its own; released with UnmapExecMemory.
// Cost: one mmap (plus, once per process, locating and opening the file).
void* MapBreakpointMemory(size_t bytes);

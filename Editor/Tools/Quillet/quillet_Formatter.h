#pragma once
// The formatter behind the DLLs' _vsnprintf and sprintf_s. It reads its arguments from a Windows
// x64 argument list: a byte pointer to consecutive 8-byte slots, one slot per argument whatever
// its type (a 32-bit value sits in the low 4 bytes of its slot).
//
// Deliberate differences from a C library's printf, which the DLLs were built against:
// - "e", "E", "g", "G" print fixed-point like "f"; floating precision is at most 16.
// - only a precision of -1 (none given) means 6 for floating output; another negative one from
//   "*" prints no point and no fraction digits, and widens the padding by its magnitude;
// - integers of 20 or more digits print only their lowest 19 digits;
// - "%p" is a signed hexadecimal number without "0x";
// - "%c" reads its argument only while the buffer has room, so once the buffer is full the next
//   conversion reads the slot meant for the "c";
// - "%5.3s" prints five characters: a width above the precision raises the precision;
// - a signed, zero-padded floating value comes out one character narrower than its width;
// - "#" is accepted and ignored; "%w" prints nothing and skips the next format character.

#include <stddef.h>

// Formats into `buffer` (of `maxlen` bytes) and terminates it whenever maxlen is not 0, truncating
// if needed. Returns the length the full output would have had, or -1 with errno ERANGE when that
// length would reach 0x7FFFFFFF (the buffer is then left unterminated).
int dopr(char* buffer, size_t maxlen, const char* format, const char* args_in);

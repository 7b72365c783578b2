#pragma once
// UTF-8 <-> UTF-16 conversion over 16-bit units.

#include <cstdint>

enum ConversionResult
{
    conversionOK,     // the whole source was converted
    sourceExhausted,  // the source ends inside a sequence (a partial character is not written)
    targetExhausted,  // the output has no room for the next character
    sourceIllegal     // the source holds an ill-formed sequence
};

enum ConversionFlags
{
    strictConversion = 0,  // unpaired surrogates are illegal
    lenientConversion      // unpaired UTF-16 surrogates pass through, encoded on their own
};

// Both advance *sourceStart and *targetStart past what was consumed and produced. On any result
// other than conversionOK they point at the start of the sequence that stopped the conversion and
// just past the last complete character written. UTF-8 input must be well formed whatever the
// flags: overlong forms, encoded surrogates, values above U+10FFFF and stray continuation bytes are
// illegal. A sequence cut off by the end of the source is sourceExhausted unless the bytes present
// are already illegal.
ConversionResult ConvertUTF8toUTF16(const uint8_t** sourceStart, const uint8_t* sourceEnd,
                                    uint16_t** targetStart, uint16_t* targetEnd, ConversionFlags flags);
ConversionResult ConvertUTF16toUTF8(const uint16_t** sourceStart, const uint16_t* sourceEnd,
                                    uint8_t** targetStart, uint8_t* targetEnd, ConversionFlags flags);

// Lenient conversion of srcLength units. Room is assumed for srcLength UTF-16 units (UTF-8 to
// UTF-16) or 4 * srcLength bytes (UTF-16 to UTF-8). False with outlength 0 for an illegal source;
// otherwise true with the number of units written (a truncated last character is dropped).
bool ConvertUTF8toUTF16(const char* source, int srcLength, uint16_t* output, int& outlength);
bool ConvertUTF16toUTF8(const uint16_t* source, int srcLength, char* output, int& outlength);

#pragma once
// Small string helpers. Case folding is plain ASCII: bytes outside 'A'..'Z' compare as they are.

#include <string>
#include <string_view>

// <0, 0 or >0 like strcmp, comparing ASCII letters case-insensitively.
int StrICmp(const char* a, const char* b);
int StrICmp(std::string_view a, std::string_view b);

bool BeginsWith(std::string_view text, std::string_view prefix);
bool BeginsWithCaseInsensitive(std::string_view text, std::string_view prefix);

char ToLower(char c);
std::string ToLower(std::string_view text);
void ToLowerInplace(std::string& text);

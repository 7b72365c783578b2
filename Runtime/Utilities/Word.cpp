#include "Runtime/Utilities/Word.h"

char ToLower(char c)
{
    return (c >= 'A' && c <= 'Z') ? static_cast<char>(c - 'A' + 'a') : c;
}

int StrICmp(std::string_view a, std::string_view b)
{
    const size_t common = a.size() < b.size() ? a.size() : b.size();
    for (size_t i = 0; i < common; ++i)
    {
        const unsigned char ca = static_cast<unsigned char>(ToLower(a[i]));
        const unsigned char cb = static_cast<unsigned char>(ToLower(b[i]));
        if (ca != cb)
            return ca < cb ? -1 : 1;
    }
    if (a.size() == b.size())
        return 0;
    return a.size() < b.size() ? -1 : 1;
}

int StrICmp(const char* a, const char* b)
{
    return StrICmp(std::string_view(a), std::string_view(b));
}

bool BeginsWith(std::string_view text, std::string_view prefix)
{
    return text.size() >= prefix.size() && text.compare(0, prefix.size(), prefix) == 0;
}

bool BeginsWithCaseInsensitive(std::string_view text, std::string_view prefix)
{
    return text.size() >= prefix.size() && StrICmp(text.substr(0, prefix.size()), prefix) == 0;
}

std::string ToLower(std::string_view text)
{
    std::string result(text);
    ToLowerInplace(result);
    return result;
}

void ToLowerInplace(std::string& text)
{
    for (char& c : text)
        c = ToLower(c);
}

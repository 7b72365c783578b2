#include "LibraryBehaviour.h"

#include "WinImports.h"

namespace
{
    // Read once per question: the list is short and the questions are few.
    const DWORD kListCapacity = 1024;

    bool ReadList(char* list)
    {
        DWORD length = GetEnvironmentVariableA(LIBRARY_BEHAVIOUR_VARIABLE, list, kListCapacity);
        if (length == 0 || length >= kListCapacity)
            return false;
        list[length] = 0;
        return true;
    }

    // Whether the item list[begin, end) equals prefix followed by name.
    bool ItemEquals(const char* item, size_t itemLength, const char* prefix, const char* name)
    {
        size_t prefixLength = _mbstrlen(prefix);
        size_t nameLength = _mbstrlen(name);
        if (itemLength != prefixLength + nameLength)
            return false;
        return strncmp(item, prefix, prefixLength) == 0 && strncmp(item + prefixLength, name, nameLength) == 0;
    }
}

bool BehaviourRequestedFor(const char* prefix, const char* name)
{
    char list[kListCapacity];
    if (!ReadList(list))
        return false;
    char* item = list;
    for (;;)
    {
        char* comma = strchr(item, ',');
        size_t itemLength = comma ? (size_t)(comma - item) : _mbstrlen(item);
        if (ItemEquals(item, itemLength, prefix, name))
            return true;
        if (!comma)
            return false;
        item = comma + 1;
    }
}

bool BehaviourRequested(const char* word)
{
    return BehaviourRequestedFor("", word);
}

bool TestExportResult(const char* exportName, bool result)
{
    if (BehaviourRequestedFor("crash:", exportName))
    {
        volatile int* nowhere = nullptr;
        *nowhere = 1;
    }
    if (BehaviourRequestedFor("fail:", exportName))
        return false;
    return result;
}

void AnnounceLoad(const char* libraryName)
{
    if (!BehaviourRequested("announce"))
        return;
    char line[128];
    sprintf_s(line, sizeof line, "%s loaded", libraryName);
    OutputDebugStringA(line);
}

#pragma once
// The thread block that Windows x64 code reaches through its GS segment. One block serves the
// whole process; PESetupFS (declared with the loader API) clears it and points the calling
// thread's GS base at it.

#include <pthread.h>
#include <stddef.h>
#include <stdint.h>

// The layout is shared with DLL machine code, so the offsets are fixed (checked below).
struct ThreadInformationBlock
{
    void* seh;
    void* stackTop;
    void* stackBottom;
    void* unknown1;
    uint32_t fiberData;
    uint32_t arbitrary;
    void* tibSelf;
    void* env;  // GS:0x30, where x64 code looks for the block's own address
    uint32_t processID;
    uint32_t threadID;
    uint32_t activeRpc;
    void* tlsArray;
    void* peb;
    uint32_t lastError;
    uint32_t ownedCsCount;
    void* csrClientThread;
    uint32_t threadInfo;
};

static_assert(offsetof(ThreadInformationBlock, tibSelf) == 0x28);
static_assert(offsetof(ThreadInformationBlock, env) == 0x30);
static_assert(offsetof(ThreadInformationBlock, activeRpc) == 64);
static_assert(offsetof(ThreadInformationBlock, tlsArray) == 72);
static_assert(offsetof(ThreadInformationBlock, lastError) == 88);
static_assert(offsetof(ThreadInformationBlock, threadInfo) == 104);

constexpr size_t kTIBSize = 4096;

// A plain (non-recursive) mutex that lives for the whole process.
class SimpleMutex
{
public:
    SimpleMutex() { pthread_mutex_init(&mutex, nullptr); }
    ~SimpleMutex() { pthread_mutex_destroy(&mutex); }
    SimpleMutex(const SimpleMutex&) = delete;
    SimpleMutex& operator=(const SimpleMutex&) = delete;

    void Lock() { pthread_mutex_lock(&mutex); }
    void Unlock() { pthread_mutex_unlock(&mutex); }

    pthread_mutex_t mutex;
};

// Guards s_TIB while it is cleared and installed.
extern SimpleMutex s_PESetupFSMutex;

// Known imports, threads and synchronisation: critical sections, thread-local slots, interlocked
// operations, pointer encoding and thread identity. Included by quillet_KnownImports.cpp only.

namespace
{
    // --- Critical sections: a host recursive mutex built in the DLL's own 40-byte object ------

    QUILLET_WINAPI void InitializeCriticalSection_impl(CRITICAL_SECTION_impl* cs)
    {
        // Recursive, because the thread that holds a critical section may enter it again.
        pthread_mutexattr_t attr;
        pthread_mutexattr_init(&attr);
        pthread_mutexattr_settype(&attr, PTHREAD_MUTEX_RECURSIVE);
        pthread_mutex_init(cs, &attr);
        pthread_mutexattr_destroy(&attr);
    }

    // Declared without a result: the spin count means nothing to a host mutex.
    QUILLET_WINAPI void InitializeCriticalSectionAndSpinCount_impl(CRITICAL_SECTION_impl* cs, unsigned int)
    {
        InitializeCriticalSection_impl(cs);
    }

    QUILLET_WINAPI void EnterCriticalSection_impl(CRITICAL_SECTION_impl* cs) { pthread_mutex_lock(cs); }
    QUILLET_WINAPI void LeaveCriticalSection_impl(CRITICAL_SECTION_impl* cs) { pthread_mutex_unlock(cs); }
    QUILLET_WINAPI void DeleteCriticalSection_impl(CRITICAL_SECTION_impl* cs) { pthread_mutex_destroy(cs); }

    // --- Thread-local slots: a slot index is a host pthread key ---------------------------------

    QUILLET_WINAPI DWORD TlsAlloc_impl()
    {
        pthread_key_t key = 0;
        pthread_key_create(&key, nullptr);
        return static_cast<DWORD>(key);
    }

    QUILLET_WINAPI BOOL TlsFree_impl(DWORD idx)
    {
        pthread_key_delete(static_cast<pthread_key_t>(idx));
        return 1;
    }

    QUILLET_WINAPI BOOL TlsSetValue_impl(DWORD idx, void* val)
    {
        pthread_setspecific(static_cast<pthread_key_t>(idx), val);
        return 1;
    }

    QUILLET_WINAPI void* TlsGetValue_impl(DWORD idx) { return pthread_getspecific(static_cast<pthread_key_t>(idx)); }

    // --- Interlocked operations: one locked compare-and-exchange each, never retried ----------

    // Reads the word, then tries once to swap it from what was read to `value`. If another thread
    // changed it in between, nothing is stored; the first value read is returned either way.
    QUILLET_WINAPI int InterlockedExchange_impl(int volatile* target, int value)
    {
        int first = *target;
        int expected = first;
        __atomic_compare_exchange_n(target, &expected, value, false, __ATOMIC_SEQ_CST, __ATOMIC_SEQ_CST);
        return first;
    }

    // Returns the comparand when the exchange happened, else the value read before the attempt.
    QUILLET_WINAPI int InterlockedCompareExchange_impl(int volatile* dest, int exchange, int comperand)
    {
        int first = *dest;
        int expected = comperand;
        if (__atomic_compare_exchange_n(dest, &expected, exchange, false, __ATOMIC_SEQ_CST, __ATOMIC_SEQ_CST))
            return comperand;
        return first;
    }

    // --- Pointer encoding, sleeping, identity -------------------------------------------------

    QUILLET_WINAPI void* EncodePointer_impl(void* ptr) { return ptr; }
    QUILLET_WINAPI void* DecodePointer_impl(void* ptr) { return ptr; }

    // Nothing the DLLs wait for can change while they sleep in this single-threaded tool.
    QUILLET_WINAPI void Sleep_impl(unsigned int) {}

    QUILLET_WINAPI DWORD GetCurrentThreadId_impl() { return static_cast<DWORD>(pthread_self()); }
    QUILLET_WINAPI DWORD GetCurrentProcessId_impl() { return static_cast<DWORD>(getpid()); }
}

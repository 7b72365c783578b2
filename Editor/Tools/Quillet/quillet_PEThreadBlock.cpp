#include "Editor/Tools/Quillet/quillet_PELoader.h"
#include "Editor/Tools/Quillet/quillet_PEThreadBlock.h"

#include <asm/prctl.h>
#include <string.h>
#include <sys/syscall.h>
#include <unistd.h>

SimpleMutex s_PESetupFSMutex;

namespace
{
    // One block for every thread: DLL code only ever finds its own address in it.
    alignas(64) uint8_t s_TIB[kTIBSize];
    ThreadInformationBlock* const tibPtr = reinterpret_cast<ThreadInformationBlock*>(s_TIB);
}

const char* PESetupFS()
{
    s_PESetupFSMutex.Lock();
    memset(s_TIB, 0, kTIBSize);
    tibPtr->tibSelf = s_TIB;
    // Cannot fail for a valid user address; nothing would be gained by checking.
    syscall(SYS_arch_prctl, ARCH_SET_GS, reinterpret_cast<unsigned long>(s_TIB));
    tibPtr->env = tibPtr->tibSelf;
    s_PESetupFSMutex.Unlock();
    return nullptr;
}

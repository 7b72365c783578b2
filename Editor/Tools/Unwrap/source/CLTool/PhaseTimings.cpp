#include "Editor/Tools/Unwrap/source/CLTool/PhaseTimings.h"

#include <cstdio>
#include <cstdlib>
#include <sys/resource.h>

PhaseTimings::PhaseTimings() : m_Last(std::chrono::steady_clock::now())
{
}

void PhaseTimings::Mark(Phase phase)
{
    auto now = std::chrono::steady_clock::now();
    m_Milliseconds[phase] += std::chrono::duration<double, std::milli>(now - m_Last).count();
    m_Last = now;
    struct rusage usage;
    if (getrusage(RUSAGE_SELF, &usage) == 0)
        m_PeakKilobytes[phase] = usage.ru_maxrss;
}

void PhaseTimings::Report() const
{
    const char* enabled = std::getenv("CHARTBAKE_TIMINGS");
    if (!enabled || !*enabled)
        return;
    std::fprintf(stderr, "ChartBake timings: load libraries %.1f ms, read %.1f ms, unwrap %.1f ms, write %.1f ms\n",
                 m_Milliseconds[kLoadLibraries], m_Milliseconds[kRead], m_Milliseconds[kUnwrap], m_Milliseconds[kWrite]);
    std::fprintf(stderr, "ChartBake peak memory: load libraries %ld KB, read %ld KB, unwrap %ld KB, write %ld KB\n",
                 m_PeakKilobytes[kLoadLibraries], m_PeakKilobytes[kRead], m_PeakKilobytes[kUnwrap], m_PeakKilobytes[kWrite]);
}

PhaseTimings& GetPhaseTimings()
{
    static PhaseTimings timings;
    return timings;
}

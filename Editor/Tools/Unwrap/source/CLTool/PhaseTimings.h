#pragma once
// Wall-clock time per phase of one run (loading the libraries, reading, unwrapping, writing) and
// the process's peak resident memory at the end of each, printed to standard error at the end
// when the environment variable CHARTBAKE_TIMINGS is set to a non-empty value. Used by the
// benchmark; silent otherwise.

#include <chrono>

class PhaseTimings
{
public:
    enum Phase { kLoadLibraries, kRead, kUnwrap, kWrite, kPhaseCount };

    PhaseTimings();
    // Ends the phase running since the last mark (or since construction) and books it to `phase`.
    void Mark(Phase phase);
    // Prints "ChartBake timings: load libraries %.1f ms, read ..." and "ChartBake peak memory: ..."
    // (kilobytes) when enabled.
    void Report() const;

private:
    std::chrono::steady_clock::time_point m_Last;
    double m_Milliseconds[kPhaseCount] = {};
    long m_PeakKilobytes[kPhaseCount] = {};
};

PhaseTimings& GetPhaseTimings();

#pragma once
// Progress on standard error for runs that take a while: nothing during the first second; after
// that, a line for the stage running then and for every stage that follows, with the time
// elapsed since the start, and a reminder every five seconds during a long stage. The environment
// variable CHARTBAKE_MESH_PROGRESS_AFTER sets other seconds than the first one (0: always).

#include <chrono>
#include <condition_variable>
#include <mutex>
#include <string>
#include <thread>

class Progress
{
public:
    explicit Progress(bool enabled);
    ~Progress();

    void Stage(const char* name);   // "reading", "unwrapping", "writing"
    double Seconds() const;         // since construction

private:
    void Watch();
    void AnnounceLocked();

    bool m_Enabled;
    std::chrono::steady_clock::time_point m_Start;
    double m_QuietSeconds;          // nothing is printed before this much time has passed
    std::mutex m_Mutex;
    std::condition_variable m_Wake;
    std::string m_Stage;
    double m_LastAnnounced = -1;    // seconds at the last line, -1 when the stage has none yet
    bool m_Done = false;
    std::thread m_Watcher;
};

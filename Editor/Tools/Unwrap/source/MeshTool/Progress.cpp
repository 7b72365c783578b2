#include "Editor/Tools/Unwrap/source/MeshTool/Progress.h"

#include <cstdio>
#include <cstdlib>

namespace
{
    const double kReminderSeconds = 5.0;

    // One second, unless CHARTBAKE_MESH_PROGRESS_AFTER names other seconds (tests set 0).
    double QuietSeconds()
    {
        const char* text = std::getenv("CHARTBAKE_MESH_PROGRESS_AFTER");
        char* end = nullptr;
        double seconds = text && *text ? std::strtod(text, &end) : 1.0;
        return end && *end == '\0' && seconds >= 0 ? seconds : 1.0;
    }
}

Progress::Progress(bool enabled)
    : m_Enabled(enabled), m_Start(std::chrono::steady_clock::now()), m_QuietSeconds(QuietSeconds())
{
    if (m_Enabled)
        m_Watcher = std::thread(&Progress::Watch, this);
}

Progress::~Progress()
{
    {
        std::lock_guard<std::mutex> lock(m_Mutex);
        m_Done = true;
    }
    m_Wake.notify_all();
    if (m_Watcher.joinable())
        m_Watcher.join();
}

double Progress::Seconds() const
{
    return std::chrono::duration<double>(std::chrono::steady_clock::now() - m_Start).count();
}

void Progress::Stage(const char* name)
{
    std::lock_guard<std::mutex> lock(m_Mutex);
    m_Stage = name;
    m_LastAnnounced = -1;
    if (m_Enabled && Seconds() >= m_QuietSeconds)
        AnnounceLocked();
}

void Progress::AnnounceLocked()
{
    m_LastAnnounced = Seconds();
    std::fprintf(stderr, "chartbake-mesh: %s... (%.1f s)\n", m_Stage.c_str(), m_LastAnnounced);
    std::fflush(stderr);
}

void Progress::Watch()
{
    std::unique_lock<std::mutex> lock(m_Mutex);
    while (!m_Done)
    {
        m_Wake.wait_for(lock, std::chrono::milliseconds(100));
        if (m_Done || m_Stage.empty())
            continue;
        double now = Seconds();
        if (now >= m_QuietSeconds && (m_LastAnnounced < 0 || now - m_LastAnnounced >= kReminderSeconds))
            AnnounceLocked();
    }
}

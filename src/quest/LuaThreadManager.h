#pragma once
// The native anchor of the script threads. The scheduler itself is script code
// (scripts/game_engine/quest.lua): it creates a coroutine per object script (CreateScript),
// resumes those whose wait is over once per frame (ManageThreads) and reads the threads'
// clock from here. This class remembers which Lua host holds the threads and which group
// timer is their clock, runs the scheduler once per frame and reports script errors.
// Native code creates and resumes coroutines only through the scheduler it calls here.
#include <string>

namespace ox::core {
class CGroupTimer;
}
namespace ox::lua {
class CLua;
}

namespace qe {

class CLuaThreadManager {
public:
    // Forgets the previous host first, with no call into it.
    void SetLua(ox::lua::CLua& lua);
    void SetTimer(const ox::core::CGroupTimer* timer) { m_Timer = timer; }
    // Milliseconds of the timer; 0 without one.
    float GetElapsedTime() const;
    // Forgets the host (the timer stays): the scheduler is not called any more.
    void Clear() { m_Lua = nullptr; }
    // The message and a line feed to standard error, then (unless silent) a "Lua Error!" box.
    void Error(const std::string& message) const;
    // One pass of the scheduler: the host's global ManageThreads, if there is a host.
    void ManageThreads();

    ox::lua::CLua* GetLua() const { return m_Lua; }
    const ox::core::CGroupTimer* GetTimer() const { return m_Timer; }

    // Boxes are left out when set; nothing in the engine sets it.
    bool m_SilentErrors = false;

private:
    ox::lua::CLua* m_Lua = nullptr;
    // The id the host is listed under, to notice that it was destroyed.
    std::string m_LuaId;
    const ox::core::CGroupTimer* m_Timer = nullptr;
};

// The process-wide manager, alive as long as the program.
struct g_LuaThreadManager {
    static CLuaThreadManager& Instance();
};

} // namespace qe

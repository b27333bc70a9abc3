#include "game/GameClock.h"

#include "core/TimeManager.h"

namespace k17 {

namespace {

std::function<int()>& Clock()
{
    static std::function<int()> clock;
    return clock;
}

} // namespace

int GetGameClock() { return Clock() ? Clock()() : ox::core::GetTimeManager().GetTime(); }

void SetGameClock(std::function<int()> clock) { Clock() = std::move(clock); }

} // namespace k17

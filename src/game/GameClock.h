#pragma once
// The clock of the start-up pictures and the window effects: the time manager's time in
// milliseconds, unless another clock was set (tests drive it by hand).
#include <functional>

namespace k17 {

int GetGameClock();
// An empty function gives the time manager's clock back.
void SetGameClock(std::function<int()> clock);

} // namespace k17

// Feeds arbitrary bytes to the replay's event-file reader, as they are and once more with the
// event size word set right so that the checks behind it are reached. What the reader takes
// must be in time order with known kinds, and must play through to its end into a widget
// manager, on a clock that moves by hand.
#include "diag/Message.h"
#include "gui/WidgetManager.h"
#include "replay/Replay.h"

#include <cstdint>
#include <cstring>
#include <vector>

using namespace ox::replay;

namespace {

void TryFile(const uint8_t* data, size_t size)
{
    uint32_t now = 0;
    CPlayback playback([&now] { return now; });
    if (!playback.LoadImage(data, size))
        return;
    const std::vector<ReplayEvent>& events = playback.GetEvents();
    for (size_t i = 0; i < events.size(); ++i)
        if (events[i].Kind() > KindChar || (i > 0 && events[i].Time < events[i - 1].Time))
            __builtin_trap();  // the reader let through what it must refuse
    ox::gui::CWidgetManager manager;
    playback.Start();
    // Big steps, so that files spanning long times end in few frames.
    for (int frame = 0; frame < 64 && playback.IsPlaying(); ++frame) {
        now += 1u << (frame / 2);
        playback.Update(manager);
    }
    if (playback.IsPlaying())
        playback.Stop();
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    static bool quiet = [] {
        ox::diag::message::SetSink([](const std::string&, const std::string&) {});
        return true;
    }();
    (void)quiet;
    TryFile(data, size);
    if (size >= 4) {
        std::vector<uint8_t> repaired(data, data + size);
        const uint32_t eventSize = kEventSize;
        std::memcpy(repaired.data(), &eventSize, 4);
        TryFile(repaired.data(), repaired.size());
    }
    return 0;
}

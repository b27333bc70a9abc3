// The seeds of the event-file fuzzer (fuzz/corpus/fuzz_replay): small recordings made here
// with the recorder, and broken copies of them, one fault each. The kept files are what this
// test makes (OX_WRITE_REPLAY_SEEDS=1 rewrites them), and the reader takes the valid ones and
// refuses every broken one.
#include "replay/Replay.h"
#include "support/TestSupport.h"

#include <cstring>
#include <filesystem>
#include <fstream>
#include <map>

using namespace ox::replay;
namespace fs = std::filesystem;

namespace {

std::string Bytes(const std::vector<ReplayEvent>& events, uint32_t size = kEventSize, uint32_t count = ~0u)
{
    if (count == ~0u)
        count = static_cast<uint32_t>(events.size());
    std::string bytes(8 + events.size() * kEventSize, '\0');
    std::memcpy(bytes.data(), &size, 4);
    std::memcpy(bytes.data() + 4, &count, 4);
    if (!events.empty())
        std::memcpy(bytes.data() + 8, events.data(), events.size() * kEventSize);
    return bytes;
}

// Every kind of event once, as the recorder writes them.
std::vector<ReplayEvent> EveryKind()
{
    oxtest::FakeClock clock;
    CRecord record(clock.Ticks());
    record.Start();
    record.OnMouseMove({512, 112}, 0);
    clock.Advance(20);
    record.OnMouseDown({512, 112}, ox::gui::LeftButton, 0);
    record.OnMouseUp({512, 112}, ox::gui::LeftButton, 0);
    clock.Advance(40);
    record.OnDoubleClick({-5, 800}, 1);
    record.OnMouseWheel({30, 40}, -120, 2);
    clock.Advance(40);
    record.OnKeyDown('A', 1, 0x1E0001);
    record.OnChar(u'Ж', 1, 0x1E0001);
    record.OnKeyUp('A', 1, 0x1E0001);
    record.Stop();
    return record.GetEvents();
}

// The seeds by name: "valid_" ones load, "broken_" ones are refused.
std::map<std::string, std::string> Seeds()
{
    const std::vector<ReplayEvent> events = EveryKind();
    std::vector<ReplayEvent> backwards = events, unknown = events;
    backwards[3].Time = 1;
    unknown[2].KindAndKeys = 0x0B;
    const std::string whole = Bytes(events);
    return {
        {"valid_every_kind", whole},
        {"valid_empty", Bytes({})},
        {"valid_one_click", Bytes({events.begin() + 1, events.begin() + 3})},
        {"broken_event_size", Bytes(events, 20)},
        {"broken_count_past_the_end", Bytes(events, kEventSize, 9)},
        {"broken_back_in_time", Bytes(backwards)},
        {"broken_unknown_kind", Bytes(unknown)},
        {"broken_cut_event", whole.substr(0, whole.size() - 5)},
        {"broken_no_header", whole.substr(0, 6)},
    };
}

} // namespace

TEST(ReplaySeeds, TheFuzzSeedsAreWhatThisTestMakesAndTheReaderJudgesThemByTheirNames)
{
    const fs::path kept = fs::path(OX_FUZZ_CORPUS) / "fuzz_replay";
    const bool write = getenv("OX_WRITE_REPLAY_SEEDS") != nullptr;
    if (write)
        fs::create_directories(kept);
    oxtest::MessageCapture boxes;
    oxtest::LogCapture log;
    for (const auto& [name, bytes] : Seeds()) {
        if (write) {
            std::ofstream(kept / name, std::ios::binary) << bytes;
        }
        EXPECT_EQ(oxtest::ReadFile(kept / name), bytes)
            << name << " differs from what this test makes: run it with OX_WRITE_REPLAY_SEEDS=1";
        CPlayback playback([] { return 0u; });
        EXPECT_EQ(playback.LoadImage(reinterpret_cast<const uint8_t*>(bytes.data()), bytes.size()),
                  name.rfind("valid_", 0) == 0)
            << name;
    }
}

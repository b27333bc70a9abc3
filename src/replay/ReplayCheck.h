#pragma once
// The companion check file of a recording: at moments of a playback (every `step` ms and at its
// end), a hash of the drawn frame and of the game's state. A playback that writes it notes the
// moments; a later playback of the same recording compares them and logs the first difference
// with its moment, the way a regression test reports it. The event file stays as it is.
//
// The file is text: "oxreplaycheck 1", "game <name>", "events <count> <hash>", "step <ms>", then
// one line a moment: "<time ms> <frame hash> <state hash>", hashes in hex.
#include "misc/WideChar.h"

#include <cstdint>
#include <functional>
#include <string>
#include <vector>

namespace ox::graphics {
class CRenderer;
}

namespace ox::replay {

struct CheckMoment {
    uint32_t Time = 0;
    uint32_t Frame = 0;
    uint32_t State = 0;
    bool operator==(const CheckMoment&) const = default;
};

// What the moments are made of. Without a frame probe the frame is the renderer's back buffer;
// without a state probe the state hash is 0.
struct CheckProbes {
    std::function<uint32_t(graphics::CRenderer*)> frame;
    std::function<uint32_t()> state;
};

// FNV-1a over bytes, and the back buffer's pixels (0 when it cannot be read).
uint32_t HashBytes(const void* data, size_t size, uint32_t seed = 2166136261u);
uint32_t HashBackBuffer(graphics::CRenderer* renderer);

class CReplayCheck {
public:
    enum Mode { Idle, Writing, Checking };

    CReplayCheck(std::string game, CheckProbes probes);
    // The game's state for the moments to come (empty: 0).
    void SetStateProbe(std::function<uint32_t()> probe) { m_Probes.state = std::move(probe); }

    // Notes moments, saved at Finish when a path is given. `events` is the hash of the
    // recording the moments belong to.
    void BeginWrite(uint32_t step, uint32_t eventCount, uint32_t events, wstring savePath = {});
    // Reads a check file to compare with; a file that does not parse or belongs to another
    // game or recording is refused with a log line.
    bool BeginCheck(const wchar* path, uint32_t eventCount, uint32_t events);
    bool BeginCheckText(const std::string& text, uint32_t eventCount, uint32_t events);

    // One moment of the playback: noted, or compared.
    void Moment(uint32_t time, graphics::CRenderer* renderer);
    // The playback ended: a check that expected more moments reports it.
    void Finish();
    bool Save(const wchar* path) const;
    std::string Text() const;

    Mode GetMode() const { return m_Mode; }
    uint32_t GetStep() const { return m_Step; }
    const std::vector<CheckMoment>& GetMoments() const { return m_Moments; }
    // The first difference as it was logged; empty while everything matched.
    const std::string& GetFirstDifference() const { return m_FirstDifference; }
    int GetDifferences() const { return m_Differences; }

private:
    void Report(const std::string& what);

    std::string m_Game;
    CheckProbes m_Probes;
    Mode m_Mode = Idle;
    uint32_t m_Step = 0;
    uint32_t m_EventCount = 0;
    uint32_t m_Events = 0;
    std::vector<CheckMoment> m_Moments;   // noted (writing) or seen (checking)
    std::vector<CheckMoment> m_Expected;  // from the file
    wstring m_SavePath;
    std::string m_FirstDifference;
    int m_Differences = 0;
};

} // namespace ox::replay

#pragma once
// Recording and playback of input. CRecord hears the events the widget manager makes from
// platform messages and keeps them with their times; SaveEvents writes them to an event file.
// CPlayback reads such a file and feeds the events to the widget manager at their recorded
// times, in place of live input, moving the visible cursor with them. Either draws a mark in
// the top-left corner while active.
//
// The event file, numbers little-endian: u32 event size (16), u32 count, then the events.
#include "gui/WidgetManager.h"
#include "misc/WideChar.h"
#include "replay/ReplayCheck.h"

#include <cstdint>
#include <functional>
#include <vector>

namespace ox::graphics {
class CRenderer;
}

namespace ox::replay {

enum EventKind : uint8_t {
    KindMouseDown = 0,
    KindMouseUp = 1,
    KindMouseMove = 2,
    KindDoubleClick = 3,
    KindMouseWheel = 4,
    KindKeyDown = 5,
    KindKeyUp = 6,
    KindChar = 7,
};

// One event as the file holds it.
struct ReplayEvent {
    uint32_t Time;        // ms of the application clock since the recording started
    uint8_t KindAndKeys;  // kind in the low 4 bits, keyboard state in the high 4
    uint8_t Zero;
    uint16_t Value;       // button, wheel delta, key or character
    uint32_t Data;        // x, y as signed 16-bit words, or the key message's raw data
    uint32_t Zero2;

    EventKind Kind() const { return static_cast<EventKind>(KindAndKeys & 0x0F); }
    int Keys() const { return KindAndKeys >> 4; }
    misc::IntVector Pos() const
    {
        return {static_cast<int16_t>(Data & 0xFFFF), static_cast<int16_t>(Data >> 16)};
    }
};
static_assert(sizeof(ReplayEvent) == 16);

constexpr uint32_t kEventSize = sizeof(ReplayEvent);

// The application clock in ms (the time manager's root, unless a test gives its own).
using Clock = std::function<uint32_t()>;

class CRecord : public gui::IInputListener {
public:
    explicit CRecord(Clock clock = {});
    static CRecord& Instance();

    void Start();
    void Stop();
    bool IsRecording() const { return m_IsRecording; }
    bool SaveEvents(const wchar* path) const;
    const std::vector<ReplayEvent>& GetEvents() const { return m_Events; }
    void Draw(graphics::CRenderer& renderer) const;

    void OnChar(wchar character, int keys, int rawKeyData) override;
    void OnKeyDown(int key, int keys, int rawKeyData) override;
    void OnKeyUp(int key, int keys, int rawKeyData) override;
    void OnMouseMove(const misc::IntVector& pos, int keys) override;
    void OnMouseDown(const misc::IntVector& pos, gui::MouseButtons button, int keys) override;
    void OnMouseUp(const misc::IntVector& pos, gui::MouseButtons button, int keys) override;
    void OnDoubleClick(const misc::IntVector& pos, int keys) override;
    void OnMouseWheel(const misc::IntVector& pos, int delta, int keys) override;

private:
    void Add(EventKind kind, int keys, uint16_t value, uint32_t data);
    void AddAt(EventKind kind, int keys, uint16_t value, const misc::IntVector& pos);

    Clock m_Clock;
    bool m_IsRecording = false;
    uint32_t m_StartTime = 0;
    std::vector<ReplayEvent> m_Events;
};

class CPlayback {
public:
    explicit CPlayback(Clock clock = {});
    static CPlayback& Instance();

    void Start();
    void Stop();
    bool IsPlaying() const { return m_IsPlaying; }
    // Refuses (false, with a log line, the list empty) a file it cannot trust: another event
    // size, a count past the end, times out of order, an unknown kind.
    bool LoadEvents(const wchar* path);
    // Takes the events of a file image, with the same checks.
    bool LoadImage(const uint8_t* data, size_t size);
    const std::vector<ReplayEvent>& GetEvents() const { return m_Events; }
    // Feeds the events whose time has passed, then stops when the list is used up.
    void Update(gui::CWidgetManager& manager);
    // Takes the check's moments (due in an update, taken in the next draw, before the mark),
    // then draws the mark.
    void Draw(graphics::CRenderer& renderer);
    // The check that notes or compares the moments of the next playbacks (not owned; null: none).
    void SetCheck(CReplayCheck* check) { m_Check = check; }
    CReplayCheck* GetCheck() const { return m_Check; }
    // A hash of the loaded events, for a check file to know its recording by.
    uint32_t GetEventsHash() const;

private:
    void Feed(const ReplayEvent& event, gui::CWidgetManager& manager);

    Clock m_Clock;
    bool m_IsPlaying = false;
    std::vector<ReplayEvent> m_Events;
    uint32_t m_Index = 0;
    uint32_t m_StartTime = 0;
    CReplayCheck* m_Check = nullptr;
    uint32_t m_NextMoment = 0;
    bool m_MomentDue = false;
    bool m_FinishDue = false;
    uint32_t m_DueTime = 0;
};

// Ctrl+Alt+P: a running playback stops; otherwise the file "replay" of the working folder
// is loaded and played. With a check set up, "replay.check" beside it is compared with the
// playback, or written by it when there is none.
void ToggleReplayFile();
// The game's name and probes for the check of "replay", a moment every `step` ms.
void SetReplayFileCheck(std::string game, CheckProbes probes, uint32_t step = 1000);
// The state the check of "replay" hashes beside the frames (a game gives its level's).
void SetReplayFileStateProbe(std::function<uint32_t()> probe);

} // namespace ox::replay

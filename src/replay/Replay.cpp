#include "replay/Replay.h"

#include "core/SystemIntegration.h"
#include "core/TimeManager.h"
#include "diag/Assert.h"
#include "diag/Log.h"
#include "diag/Message.h"
#include "graphics/Renderer.h"
#include "gui/GuiServices.h"
#include "misc/Unicode.h"

#include <cstdio>
#include <cstring>
#include <filesystem>
#include <memory>

namespace ox::replay {

using misc::IntVector;

namespace {

Clock OrAppClock(Clock clock)
{
    if (clock)
        return clock;
    return [] { return core::CTimeManager::Instance().GetAppTime(); };
}

uint32_t PackPos(const IntVector& pos)
{
    return static_cast<uint16_t>(pos.X) | (static_cast<uint32_t>(static_cast<uint16_t>(pos.Y)) << 16);
}

uint32_t ReadU32(const uint8_t* p)
{
    return p[0] | (p[1] << 8) | (p[2] << 16) | (static_cast<uint32_t>(p[3]) << 24);
}

constexpr const wchar* kCheckFile = u"replay.check";
uint32_t g_CheckStep = 1000;

struct FileCloser {
    void operator()(FILE* file) const { fclose(file); }
};
using FilePtr = std::unique_ptr<FILE, FileCloser>;

FilePtr OpenFile(const wchar* path, const char* mode)
{
    if (!path)
        return nullptr;
    return FilePtr(fopen(misc::WideToUtf8(path).c_str(), mode));
}

} // namespace

// Recording ---------------------------------------------------------------------------------

CRecord::CRecord(Clock clock) : m_Clock(OrAppClock(std::move(clock))) {}

CRecord& CRecord::Instance()
{
    static CRecord* record = new CRecord;
    return *record;
}

void CRecord::Start()
{
    OX_ASSERT(!m_IsRecording);
    m_IsRecording = true;
    m_StartTime = m_Clock();
}

void CRecord::Stop()
{
    OX_ASSERT(m_IsRecording);
    m_IsRecording = false;
}

bool CRecord::SaveEvents(const wchar* path) const
{
    OX_ASSERT(!m_IsRecording);
    OX_ASSERT(!m_Events.empty());
    FilePtr file = OpenFile(path, "wb");
    if (!file)
        return false;
    const uint32_t header[2] = {kEventSize, static_cast<uint32_t>(m_Events.size())};
    bool written = fwrite(header, sizeof(header), 1, file.get()) == 1;
    if (!m_Events.empty())
        written = written && fwrite(m_Events.data(), kEventSize, m_Events.size(), file.get()) == m_Events.size();
    if (!written)
        OX_LOG("replay", diag::LogError, "cannot write the event file \"%s\"", misc::WideToUtf8(path).c_str());
    return written;
}

void CRecord::Add(EventKind kind, int keys, uint16_t value, uint32_t data)
{
    if (!m_IsRecording)
        return;
    ReplayEvent event {};
    event.Time = m_Clock() - m_StartTime;
    event.KindAndKeys = static_cast<uint8_t>(kind | ((keys & 0x0F) << 4));
    event.Value = value;
    event.Data = data;
    m_Events.push_back(event);
}

void CRecord::AddAt(EventKind kind, int keys, uint16_t value, const IntVector& pos)
{
    Add(kind, keys, value, PackPos(pos));
}

void CRecord::OnChar(wchar character, int keys, int rawKeyData)
{
    Add(KindChar, keys, character, static_cast<uint32_t>(rawKeyData));
}

void CRecord::OnKeyDown(int key, int keys, int rawKeyData)
{
    Add(KindKeyDown, keys, static_cast<uint16_t>(key), static_cast<uint32_t>(rawKeyData));
}

void CRecord::OnKeyUp(int key, int keys, int rawKeyData)
{
    Add(KindKeyUp, keys, static_cast<uint16_t>(key), static_cast<uint32_t>(rawKeyData));
}

void CRecord::OnMouseMove(const IntVector& pos, int keys) { AddAt(KindMouseMove, keys, 0, pos); }

void CRecord::OnMouseDown(const IntVector& pos, gui::MouseButtons button, int keys)
{
    AddAt(KindMouseDown, keys, static_cast<uint16_t>(button), pos);
}

void CRecord::OnMouseUp(const IntVector& pos, gui::MouseButtons button, int keys)
{
    AddAt(KindMouseUp, keys, static_cast<uint16_t>(button), pos);
}

void CRecord::OnDoubleClick(const IntVector& pos, int keys) { AddAt(KindDoubleClick, keys, 0, pos); }

void CRecord::OnMouseWheel(const IntVector& pos, int delta, int keys)
{
    AddAt(KindMouseWheel, keys, static_cast<uint16_t>(delta), pos);
}

void CRecord::Draw(graphics::CRenderer& renderer) const
{
    if (m_IsRecording)
        renderer.RenderFilledPoly4(misc::RectToPoly4({0, 0, 50, 50}), graphics::Color(0xFFFF0000u));
}

// Playback ----------------------------------------------------------------------------------

CPlayback::CPlayback(Clock clock) : m_Clock(OrAppClock(std::move(clock))) {}

CPlayback& CPlayback::Instance()
{
    static CPlayback* playback = new CPlayback;
    return *playback;
}

bool CPlayback::LoadEvents(const wchar* path)
{
    FilePtr file = OpenFile(path, "rb");
    if (!file) {
        OX_LOG("replay", diag::LogError, "cannot open the event file \"%s\"", path ? misc::WideToUtf8(path).c_str() : "");
        return false;
    }
    std::vector<uint8_t> bytes;
    uint8_t buffer[4096];
    for (size_t got; (got = fread(buffer, 1, sizeof(buffer), file.get())) > 0;)
        bytes.insert(bytes.end(), buffer, buffer + got);
    return LoadImage(bytes.data(), bytes.size());
}

bool CPlayback::LoadImage(const uint8_t* data, size_t size)
{
    m_Events.clear();
    m_Index = 0;
    if (size < 8 || ReadU32(data) != kEventSize) {
        OX_LOG("replay", diag::LogError, "the event file has another event size or no header: refused");
        diag::message::Show(u"Ошибка", u"Невозможно загрузить файл с данными!\n Файл испорчен либо сохранен "
                                       u"другой версией движка");
        return false;
    }
    const uint32_t count = ReadU32(data + 4);
    if (count > (size - 8) / kEventSize) {
        OX_LOG("replay", diag::LogError, "the event file holds fewer events than its count %u: refused", count);
        return false;
    }
    std::vector<ReplayEvent> events(count);
    if (count)
        std::memcpy(events.data(), data + 8, count * kEventSize);
    for (uint32_t i = 0; i < count; ++i) {
        if (events[i].Kind() > KindChar || (i > 0 && events[i].Time < events[i - 1].Time)) {
            OX_LOG("replay", diag::LogError, "event %u of the event file has an unknown kind or goes back in time: "
                   "refused", i);
            return false;
        }
    }
    m_Events = std::move(events);
    return true;
}

void CPlayback::Start()
{
    OX_ASSERT(!m_IsPlaying);
    m_IsPlaying = true;
    m_StartTime = m_Clock();
    m_Index = 0;
    m_NextMoment = 0;
    m_MomentDue = m_FinishDue = false;
}

void CPlayback::Stop()
{
    OX_ASSERT(m_IsPlaying);
    m_IsPlaying = false;
}

uint32_t CPlayback::GetEventsHash() const { return HashBytes(m_Events.data(), m_Events.size() * kEventSize); }

void CPlayback::Update(gui::CWidgetManager& manager)
{
    if (!m_IsPlaying)
        return;
    const uint32_t t = m_Clock() - m_StartTime;
    // An event whose time equals t waits for the next frame.
    while (m_IsPlaying && m_Index < m_Events.size() && m_Events[m_Index].Time < t)
        Feed(m_Events[m_Index++], manager);
    const bool checked = m_Check && m_Check->GetMode() != CReplayCheck::Idle && m_Check->GetStep() > 0;
    if (checked && t >= m_NextMoment) {
        m_MomentDue = true;
        m_DueTime = t;
        m_NextMoment = t - t % m_Check->GetStep() + m_Check->GetStep();
    }
    if (m_IsPlaying && m_Index >= m_Events.size()) {
        Stop();
        m_MomentDue = m_FinishDue = checked;
        m_DueTime = t;
    }
}

void CPlayback::Feed(const ReplayEvent& event, gui::CWidgetManager& manager)
{
    const IntVector pos = event.Pos();
    const int keys = event.Keys();
    const int raw = static_cast<int>(event.Data);
    const auto button = static_cast<gui::MouseButtons>(event.Value);
    switch (event.Kind()) {
    case KindMouseDown: manager.OnMouseDown(pos, button, keys); break;
    case KindMouseUp: manager.OnMouseUp(pos, button, keys); break;
    case KindMouseMove: {
        manager.OnMouseMove(pos, keys);
        // The visible cursor follows the recording.
        const misc::FloatVector scale = manager.GetScale();
        const misc::FloatRect& active = manager.GetActiveRect();
        IntVector p(static_cast<int>(static_cast<float>(pos.X) * scale.X) + static_cast<int>(active.X),
                    static_cast<int>(static_cast<float>(pos.Y) * scale.Y) + static_cast<int>(active.Y));
        if (core::CSystemIntegration* platform = gui::GetGuiServices().platform) {
            platform->ClientToScreen(p);
            platform->SetCursorPos(p);
        }
        break;
    }
    case KindDoubleClick: manager.OnDoubleClick(pos, keys); break;
    case KindMouseWheel: manager.OnMouseWheel(pos, static_cast<int16_t>(event.Value), keys); break;
    case KindKeyDown: manager.OnKeyDown(event.Value, keys, raw); break;
    case KindKeyUp: manager.OnKeyUp(event.Value, keys, raw); break;
    case KindChar: manager.OnChar(static_cast<wchar>(event.Value), keys, raw); break;
    default: OX_CHECK_DATA(false);
    }
}

void CPlayback::Draw(graphics::CRenderer& renderer)
{
    if (m_Check && m_MomentDue)
        m_Check->Moment(m_DueTime, &renderer);
    if (m_Check && m_FinishDue)
        m_Check->Finish();
    m_MomentDue = m_FinishDue = false;
    if (!m_IsPlaying)
        return;
    const misc::Poly4 triangle {{{0, 0}, {40, 25}, {40, 25}, {0, 50}}};
    renderer.RenderFilledPoly4(triangle, graphics::Color(0xFF00FF00u));
}

void ToggleReplayFile()
{
    CPlayback& playback = CPlayback::Instance();
    if (playback.IsPlaying()) {
        playback.Stop();
        return;
    }
    playback.LoadEvents(u"replay");
    if (CReplayCheck* check = playback.GetCheck()) {
        const uint32_t count = static_cast<uint32_t>(playback.GetEvents().size());
        if (std::filesystem::exists("replay.check"))
            check->BeginCheck(kCheckFile, count, playback.GetEventsHash());
        else
            check->BeginWrite(g_CheckStep, count, playback.GetEventsHash(), kCheckFile);
    }
    playback.Start();
}

void SetReplayFileCheck(std::string game, CheckProbes probes, uint32_t step)
{
    static CReplayCheck* check = nullptr;
    delete check;
    check = new CReplayCheck(std::move(game), std::move(probes));
    g_CheckStep = step;
    CPlayback::Instance().SetCheck(check);
}

void SetReplayFileStateProbe(std::function<uint32_t()> probe)
{
    if (CReplayCheck* check = CPlayback::Instance().GetCheck())
        check->SetStateProbe(std::move(probe));
}

} // namespace ox::replay

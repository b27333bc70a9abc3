#include "replay/ReplayCheck.h"

#include "diag/Log.h"
#include "graphics/Renderer.h"
#include "misc/Unicode.h"

#include <cinttypes>
#include <cstdio>
#include <fstream>
#include <sstream>

namespace ox::replay {

namespace {

constexpr const char* kMagic = "oxreplaycheck 1";

std::string Hex(uint32_t value)
{
    char text[12];
    snprintf(text, sizeof(text), "%08" PRIx32, value);
    return text;
}

} // namespace

uint32_t HashBytes(const void* data, size_t size, uint32_t seed)
{
    const auto* bytes = static_cast<const uint8_t*>(data);
    uint32_t hash = seed;
    for (size_t i = 0; i < size; ++i)
        hash = (hash ^ bytes[i]) * 16777619u;
    return hash;
}

uint32_t HashBackBuffer(graphics::CRenderer* renderer)
{
    std::vector<uint32_t> pixels;
    unsigned width = 0, height = 0;
    if (!renderer || !renderer->ReadBackBuffer(pixels, width, height, {}))
        return 0;
    return HashBytes(pixels.data(), pixels.size() * sizeof(uint32_t));
}

CReplayCheck::CReplayCheck(std::string game, CheckProbes probes) : m_Game(std::move(game)), m_Probes(std::move(probes))
{
    if (!m_Probes.frame)
        m_Probes.frame = &HashBackBuffer;
}

void CReplayCheck::BeginWrite(uint32_t step, uint32_t eventCount, uint32_t events, wstring savePath)
{
    m_SavePath = std::move(savePath);
    m_Mode = Writing;
    m_Step = step;
    m_EventCount = eventCount;
    m_Events = events;
    m_Moments.clear();
    m_Expected.clear();
    m_FirstDifference.clear();
    m_Differences = 0;
}

bool CReplayCheck::BeginCheck(const wchar* path, uint32_t eventCount, uint32_t events)
{
    m_Mode = Idle;
    std::ifstream file(misc::WideToUtf8(path ? path : u""), std::ios::binary);
    if (!file) {
        OX_LOG("replay", diag::LogError, "cannot open the check file \"%s\"", misc::WideToUtf8(path ? path : u"").c_str());
        return false;
    }
    std::stringstream text;
    text << file.rdbuf();
    return BeginCheckText(text.str(), eventCount, events);
}

bool CReplayCheck::BeginCheckText(const std::string& text, uint32_t eventCount, uint32_t events)
{
    m_Mode = Idle;
    std::istringstream in(text);
    std::string magic, gameLine, word;
    uint32_t count = 0, hash = 0, step = 0;
    std::getline(in, magic);
    std::getline(in, gameLine);
    const bool named = gameLine.rfind("game ", 0) == 0;
    const std::string game = named ? gameLine.substr(5) : std::string();
    in >> word >> count >> std::hex >> hash >> std::dec;
    const bool eventsLine = word == "events";
    in >> word >> step;
    if (magic != kMagic || !named || !eventsLine || word != "step" || !in || step == 0) {
        OX_LOG("replay", diag::LogError, "the check file does not parse: playback goes on unchecked");
        return false;
    }
    if (game != m_Game || count != eventCount || hash != events) {
        OX_LOG("replay", diag::LogError, "the check file belongs to another game or recording (\"%s\", %u events): "
               "playback goes on unchecked", game.c_str(), count);
        return false;
    }
    std::vector<CheckMoment> expected;
    CheckMoment moment;
    while (in >> std::dec >> moment.Time >> std::hex >> moment.Frame >> moment.State)
        expected.push_back(moment);
    if (!in.eof()) {
        OX_LOG("replay", diag::LogError, "moment %zu of the check file does not parse: playback goes on unchecked",
               expected.size() + 1);
        return false;
    }
    BeginWrite(step, eventCount, events);
    m_Mode = Checking;
    m_Expected = std::move(expected);
    return true;
}

void CReplayCheck::Moment(uint32_t time, graphics::CRenderer* renderer)
{
    if (m_Mode == Idle)
        return;
    const CheckMoment seen {time, m_Probes.frame(renderer), m_Probes.state ? m_Probes.state() : 0u};
    const size_t index = m_Moments.size();
    m_Moments.push_back(seen);
    if (m_Mode != Checking)
        return;
    if (index >= m_Expected.size()) {
        Report("moment " + std::to_string(index + 1) + " at " + std::to_string(time) + " ms is one more than recorded");
        return;
    }
    const CheckMoment& want = m_Expected[index];
    const std::string at = "moment " + std::to_string(index + 1) + " at " + std::to_string(time) + " ms: ";
    if (want.Time != seen.Time)
        Report(at + "expected at " + std::to_string(want.Time) + " ms");
    else if (want.Frame != seen.Frame)
        Report(at + "the frame differs (" + Hex(seen.Frame) + ", expected " + Hex(want.Frame) + ")");
    else if (want.State != seen.State)
        Report(at + "the level state differs (" + Hex(seen.State) + ", expected " + Hex(want.State) + ")");
}

void CReplayCheck::Finish()
{
    if (m_Mode == Writing && !m_SavePath.empty() && Save(m_SavePath.c_str()))
        OX_LOG("replay", diag::LogInfo, "check file written: %zu moments", m_Moments.size());
    if (m_Mode == Checking && m_Moments.size() < m_Expected.size())
        Report("the playback ended after " + std::to_string(m_Moments.size()) + " moments of " +
               std::to_string(m_Expected.size()));
    if (m_Mode == Checking && m_Differences == 0)
        OX_LOG("replay", diag::LogInfo, "replay check passed: %zu moments match", m_Moments.size());
}

void CReplayCheck::Report(const std::string& what)
{
    if (m_Differences++ == 0) {
        m_FirstDifference = what;
        OX_LOG("replay", diag::LogError, "replay check: first difference at %s", what.c_str());
    }
}

std::string CReplayCheck::Text() const
{
    std::string text = std::string(kMagic) + "\ngame " + m_Game + "\nevents " + std::to_string(m_EventCount) + " " +
                       Hex(m_Events) + "\nstep " + std::to_string(m_Step) + "\n";
    for (const CheckMoment& moment : m_Moments)
        text += std::to_string(moment.Time) + " " + Hex(moment.Frame) + " " + Hex(moment.State) + "\n";
    return text;
}

bool CReplayCheck::Save(const wchar* path) const
{
    std::ofstream file(misc::WideToUtf8(path ? path : u""), std::ios::binary | std::ios::trunc);
    file << Text();
    file.close();
    if (!file)
        OX_LOG("replay", diag::LogError, "cannot write the check file \"%s\"", misc::WideToUtf8(path ? path : u"").c_str());
    return static_cast<bool>(file);
}

} // namespace ox::replay

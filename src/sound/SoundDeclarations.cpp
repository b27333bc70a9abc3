#include "sound/SoundDeclarations.h"

#include "diag/Assert.h"
#include "diag/Log.h"
#include "misc/GamePack.h"
#include "misc/XmlParser.h"
#include "misc/sys/Path.h"

#include <algorithm>
#include <cerrno>
#include <climits>
#include <cstdlib>
#include <cstring>
#include <string_view>

namespace ox::sound {

namespace {

constexpr size_t kMaxValueLength = 1024;

// The attributes a sound must give, by bit.
enum : uint32_t {
    HasId = 1 << 0,
    HasFile = 1 << 1,
    HasGroup = 1 << 2,
    HasBalance = 1 << 3,
    HasVolume = 1 << 4,
    HasPriority = 1 << 5,
    HasRepeat = 1 << 6,
    HasMax = 1 << 7,
    HasDelay = 1 << 8,
    HasSpeed = 1 << 9,
    HasAll = (1 << 10) - 1,
};

struct Conversion {
    const char* name;
    const char* data;
    std::vector<SoundRecord> records;
    std::vector<uint32_t> flagStack;  // one word per open sound_group
    int soundDepth = -1;              // the open sound element, -1 for none
    uint32_t seen = 0;
    unsigned line = 0;
};

template <size_t N>
void SetString(misc::String<char, N>& s, std::string_view text, const Conversion& c, const char* what)
{
    if (text.size() >= N)
        OX_LOG("sound", diag::LogWarning, "%s line %u: %s \"%.*s\" is longer than %zu characters and is cut",
               c.name, c.line, what, static_cast<int>(text.size()), text.data(), N - 1);
    s = text.substr(0, N - 1);
    s.hash = 0;
    s.Hash();
}

float ToFloat(const std::string& text) { return std::strtof(text.c_str(), nullptr); }

int32_t ToInt(const std::string& text)
{
    return static_cast<int32_t>(std::clamp(std::strtol(text.c_str(), nullptr, 10), long(INT_MIN), long(INT_MAX)));
}

void OnStart(void* user, misc::XmlRecord* stack, int depth)
{
    auto& c = *static_cast<Conversion*>(user);
    const std::string_view element(stack[depth].name, stack[depth].nameLength);
    if (element == "sound_group") {
        c.flagStack.push_back(0);
    } else if (element == "sound") {
        c.line = misc::XmlLineOf(c.data, stack[depth].name);
        if (c.soundDepth >= 0) {
            OX_LOG("sound", diag::LogWarning, "%s line %u: a sound inside a sound is ignored", c.name, c.line);
            return;
        }
        c.records.emplace_back();
        SoundRecord& r = c.records.back();
        r.balance = r.volume = r.concurrent_sound_play_delay = r.speed = 0.0f;
        r.priority = r.repeat = r.max_concurrent_sound_play = 0;
        r.flags = 0;
        c.soundDepth = depth;
        c.seen = 0;
    }
}

void OnAttribute(void* user, misc::XmlRecord* /*stack*/, int depth, const char* name, size_t nameLength, const char* value,
                 size_t valueLength, bool /*utf8*/)
{
    auto& c = *static_cast<Conversion*>(user);
    const std::string_view attribute(name, nameLength);
    if (valueLength >= kMaxValueLength) {
        OX_LOG("sound", diag::LogWarning, "%s line %u: the value of %.*s is 1024 bytes or longer and is ignored",
               c.name, misc::XmlLineOf(c.data, name), static_cast<int>(nameLength), name);
        return;
    }
    const std::string text(value, valueLength);
    if (c.soundDepth < 0) {
        // Outside a sound, flags belong to the innermost group.
        if (attribute == "flags" && !c.flagStack.empty())
            c.flagStack.back() = text.find("load_on_demand") != std::string::npos ? SoundDeclarationsLoader::FlagLoadOnDemand : 0;
        return;
    }
    if (depth != c.soundDepth)
        return;
    SoundRecord& r = c.records.back();
    if (attribute == "id") {
        SetString(r.id, text, c, "id");
        c.seen |= HasId;
    } else if (attribute == "file") {
        std::string file = text;
        for (char& ch : file)
            ch = ch == '\\' ? '/' : static_cast<char>(ch >= 'A' && ch <= 'Z' ? ch - 'A' + 'a' : ch);
        SetString(r.file, file, c, "file");
        c.seen |= HasFile;
    } else if (attribute == "group_template") {
        SetString(r.group_template, text, c, "group_template");
        c.seen |= HasGroup;
    } else if (attribute == "balance") {
        r.balance = ToFloat(text);
        c.seen |= HasBalance;
    } else if (attribute == "volume") {
        r.volume = ToFloat(text);
        c.seen |= HasVolume;
    } else if (attribute == "speed") {
        r.speed = ToFloat(text);
        c.seen |= HasSpeed;
    } else if (attribute == "concurrent_sound_play_delay") {
        r.concurrent_sound_play_delay = ToFloat(text);
        c.seen |= HasDelay;
    } else if (attribute == "priority") {
        r.priority = ToInt(text);
        c.seen |= HasPriority;
    } else if (attribute == "repeat") {
        r.repeat = ToInt(text);
        c.seen |= HasRepeat;
    } else if (attribute == "max_concurrent_sound_play") {
        r.max_concurrent_sound_play = ToInt(text);
        c.seen |= HasMax;
    }
}

void OnEnd(void* user, misc::XmlRecord* stack, int depth)
{
    auto& c = *static_cast<Conversion*>(user);
    const std::string_view element(stack[depth].name, stack[depth].nameLength);
    if (element == "sound_group") {
        if (!c.flagStack.empty())
            c.flagStack.pop_back();
        return;
    }
    if (element != "sound" || depth != c.soundDepth)
        return;
    c.soundDepth = -1;
    SoundRecord& r = c.records.back();
    r.flags = c.flagStack.empty() ? 0 : c.flagStack.back();
    if (!(c.seen & HasId) || r.id.empty()) {
        OX_LOG("sound", diag::LogWarning, "%s line %u: a sound without an id is ignored", c.name, c.line);
        c.records.pop_back();
        return;
    }
    if ((c.seen & HasAll) != HasAll)
        OX_LOG("sound", diag::LogWarning, "%s line %u: sound \"%s\" lacks some of its attributes; they are taken as 0",
               c.name, c.line, r.id.c_str());
}

template <size_t N>
bool StringIsSound(const misc::String<char, N>& s)
{
    return s.max_size == N && s.size < N && s.m_Data[s.size] == 0;
}

} // namespace

SoundDeclarationsLoader::SoundDeclarationsLoader(misc::CGamePack* pack) : m_Pack(pack) {}

SoundDeclarationsLoader::~SoundDeclarationsLoader() { Release(); }

misc::CGamePack& SoundDeclarationsLoader::Pack() const { return m_Pack ? *m_Pack : misc::g_GamePack::Instance(); }

void SoundDeclarationsLoader::Release()
{
    if (m_File)
        Pack().Close(m_File);
    m_File = nullptr;
    m_Data = nullptr;
    m_Size = 0;
    m_Owned = false;
    m_Block.clear();
}

bool SoundDeclarationsLoader::Load()
{
    Release();
    misc::CGamePack& pack = Pack();
    unsigned size = 0;
    if (const void* data = pack.Open(kSoundsBindump, &size)) {
        if (!Check(data, size, kSoundsBindump)) {
            pack.Close(data);
            return false;
        }
        m_File = data;
        m_Data = static_cast<const SoundDeclarationsHeader*>(data);
        m_Size = size;
        return true;
    }
    const void* xml = pack.Open(kSoundsXml, &size);
    if (!xml) {
        OX_LOG("sound", diag::LogWarning, "no sound declarations: neither %s nor %s exists; no sound plays",
               kSoundsBindump, kSoundsXml);
        return false;
    }
    std::vector<uint8_t> block;
    const bool converted = ConvertXml(static_cast<const char*>(xml), size, kSoundsXml, block);
    pack.Close(xml);
    if (!converted)
        return false;
    m_Block.assign((block.size() + 3) / 4, 0);
    memcpy(m_Block.data(), block.data(), block.size());
    m_Data = reinterpret_cast<const SoundDeclarationsHeader*>(m_Block.data());
    m_Size = block.size();
    m_Owned = true;
    return true;
}

const SoundDeclarationsHeader* SoundDeclarationsLoader::GetData() const
{
    OX_ASSERT(m_Data != 0);
    return m_Data;
}

const SoundRecord* SoundDeclarationsLoader::GetRecords() const
{
    return m_Data ? reinterpret_cast<const SoundRecord*>(m_Data + 1) : nullptr;
}

bool SoundDeclarationsLoader::Save() const
{
    OX_ASSERT(m_Data != 0);
    if (!m_Data || !m_Owned)
        return false;
    return misc::sys::WriteFileAtomically(kSoundsBindump, m_Data, m_Size);
}

bool SoundDeclarationsLoader::ConvertXml(const char* xml, size_t size, const char* name, std::vector<uint8_t>& block)
{
    Conversion c;
    c.name = name;
    c.data = xml;
    misc::XmlParseProblem problem;
    if (!misc::ParseXml(xml, size, &c, OnStart, OnAttribute, nullptr, OnEnd, nullptr, &problem)) {
        OX_LOG("sound", diag::LogError, "cannot read sound declarations %s: line %u: %s", name, problem.line,
               problem.what.empty() ? "not an XML file" : problem.what.c_str());
        return false;
    }
    if (!problem.what.empty())
        OX_LOG("sound", diag::LogWarning, "sound declarations %s: line %u: %s", name, problem.line,
               problem.what.c_str());
    const SoundDeclarationsHeader header {{'S', 'N', 'D', 'S'}, static_cast<uint32_t>(c.records.size())};
    block.resize(sizeof(header) + c.records.size() * sizeof(SoundRecord));
    memcpy(block.data(), &header, sizeof(header));
    if (!c.records.empty())
        memcpy(block.data() + sizeof(header), c.records.data(), c.records.size() * sizeof(SoundRecord));
    return true;
}

bool SoundDeclarationsLoader::Check(const void* data, size_t size, const char* name)
{
    if (!data || size < sizeof(SoundDeclarationsHeader)) {
        OX_LOG("sound", diag::LogError, "sound declarations %s: %zu bytes are too few", name, size);
        return false;
    }
    const auto* header = static_cast<const SoundDeclarationsHeader*>(data);
    if (memcmp(header->magic, "SNDS", 4) != 0)
        OX_LOG("sound", diag::LogWarning, "sound declarations %s do not begin with SNDS; read as sound records", name);
    if (header->count > (size - sizeof(*header)) / sizeof(SoundRecord)) {
        OX_LOG("sound", diag::LogError, "sound declarations %s: %u records do not fit in %zu bytes", name,
               header->count, size);
        return false;
    }
    const auto* records = reinterpret_cast<const SoundRecord*>(header + 1);
    for (uint32_t i = 0; i < header->count; ++i) {
        const SoundRecord& r = records[i];
        if (!StringIsSound(r.file) || !StringIsSound(r.id) || !StringIsSound(r.group_template)) {
            OX_LOG("sound", diag::LogError, "sound declarations %s: record %u holds a broken string", name, i);
            return false;
        }
    }
    return true;
}

} // namespace ox::sound

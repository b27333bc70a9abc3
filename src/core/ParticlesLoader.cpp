#include "core/ParticlesLoader.h"

#include "diag/Assert.h"
#include "diag/Log.h"
#include "diag/Message.h"
#include "misc/GamePack.h"
#include "misc/XmlParser.h"
#include "misc/sys/Path.h"

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <strings.h>

namespace ox::core {

namespace {

constexpr const char* kChannel = "particle";
constexpr size_t kMaxValueLength = 256;

misc::CGamePack& PackOf(misc::CGamePack* pack) { return pack ? *pack : misc::g_GamePack::Instance(); }

enum class Kind { Float, Int, Unsigned, Vector, Curve, Colour, Text };

struct Field {
    const char* name;
    size_t offset;
    Kind kind;
};

#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Winvalid-offsetof"
#define OX_FIELD(name, kind) {#name, offsetof(ParticleDesc, name), Kind::kind}
const Field kFields[] = {
    OX_FIELD(id, Text), OX_FIELD(pos, Vector), OX_FIELD(direction, Float), OX_FIELD(spread, Float),
    OX_FIELD(start_speed_max, Float), OX_FIELD(start_speed_min, Float), OX_FIELD(rad_acc_max, Float),
    OX_FIELD(rad_acc_min, Float), OX_FIELD(tang_acc_max, Float), OX_FIELD(tang_acc_min, Float),
    OX_FIELD(grav_max, Float), OX_FIELD(grav_min, Float), OX_FIELD(wind_max, Float), OX_FIELD(wind_min, Float),
    OX_FIELD(life_time_max, Float), OX_FIELD(life_time_min, Float), OX_FIELD(max_life_particles, Int),
    OX_FIELD(emission, Float), OX_FIELD(system_life_time, Float), OX_FIELD(flags, Unsigned),
    OX_FIELD(wind_direction, Float), OX_FIELD(emiter_type, Int), OX_FIELD(emiter_size, Vector),
    OX_FIELD(emiter_angle, Float), OX_FIELD(spin, Curve), OX_FIELD(size, Curve), OX_FIELD(start_color, Colour),
    OX_FIELD(mid_color, Colour), OX_FIELD(end_color, Colour), OX_FIELD(var_color, Colour),
    OX_FIELD(base_var_color, Colour), OX_FIELD(tex_id, Text),
};
#undef OX_FIELD
#pragma GCC diagnostic pop

// Reads `count` numbers parted by blanks; false unless all are there.
bool ReadFloats(const char* text, float* out, int count)
{
    char* end = nullptr;
    for (int i = 0; i < count; ++i, text = end) {
        out[i] = strtof(text, &end);
        if (end == text)
            return false;
    }
    return true;
}

// Sets one attribute of a record; false when its value cannot be read.
bool SetField(ParticleDesc& record, const Field& field, const char* value)
{
    auto* at = reinterpret_cast<uint8_t*>(&record) + field.offset;
    char* end = nullptr;
    switch (field.kind) {
    case Kind::Float:
        return ReadFloats(value, reinterpret_cast<float*>(at), 1);
    case Kind::Vector:
        return ReadFloats(value, reinterpret_cast<float*>(at), 2);
    case Kind::Curve:
        return ReadFloats(value, reinterpret_cast<float*>(at), 5);
    case Kind::Int: {
        const long long n = strtoll(value, &end, 10);
        *reinterpret_cast<int32_t*>(at) = static_cast<int32_t>(std::clamp<long long>(n, INT32_MIN, INT32_MAX));
        return end != value;
    }
    case Kind::Unsigned:
    case Kind::Colour: {
        const long long n = strtoll(value, &end, 10);
        const auto word = static_cast<uint32_t>(n);
        if (field.kind == Kind::Colour)
            *reinterpret_cast<graphics::Color*>(at) = graphics::Color(word);
        else
            *reinterpret_cast<uint32_t*>(at) = word;
        return end != value;
    }
    case Kind::Text:
        if (strlen(value) >= misc::StringA88::kCapacity)
            return false;
        *reinterpret_cast<misc::StringA88*>(at) = value;
        return true;
    }
    return false;
}

struct Conversion {
    const char* name;
    const char* xml;
    std::vector<ParticleDesc>& records;
    int depth = -1;  // of the open `particle` element, -1 outside one
};

bool IsName(const misc::XmlRecord& record, const char* name)
{
    return record.nameLength == strlen(name) && memcmp(record.name, name, record.nameLength) == 0;
}

void OnStart(void* user, misc::XmlRecord* stack, int depth)
{
    auto& c = *static_cast<Conversion*>(user);
    if (c.depth < 0 && IsName(stack[depth], "particle")) {
        c.records.emplace_back();
        c.depth = depth;
    }
}

void OnAttribute(void* user, misc::XmlRecord* stack, int depth, const char* name, size_t nameLength,
                 const char* value, size_t valueLength, bool)
{
    auto& c = *static_cast<Conversion*>(user);
    if (depth != c.depth)
        return;
    const std::string attribute(name, nameLength);
    const Field* field = std::find_if(std::begin(kFields), std::end(kFields),
                                      [&](const Field& f) { return attribute == f.name; });
    if (field == std::end(kFields))
        return;
    ParticleDesc& record = c.records.back();
    const unsigned line = misc::XmlLineOf(c.xml, stack[depth].name);
    if (valueLength >= kMaxValueLength) {
        OX_LOG(kChannel, diag::LogError, "%s:%u: particle '%s': the value of '%s' is %zu bytes long; ignored",
               c.name, line, record.id.c_str(), attribute.c_str(), valueLength);
        return;
    }
    const std::string text(value, valueLength);
    if (!SetField(record, *field, text.c_str()))
        OX_LOG(kChannel, diag::LogError, "%s:%u: particle '%s': cannot read '%s' from \"%s\"", c.name, line,
               record.id.c_str(), attribute.c_str(), text.c_str());
}

void OnEnd(void* user, misc::XmlRecord*, int depth)
{
    auto& c = *static_cast<Conversion*>(user);
    if (depth == c.depth)
        c.depth = -1;
}

} // namespace

bool ConvertParticlesXml(const char* xml, size_t size, const char* name, std::vector<ParticleDesc>& records)
{
    Conversion c {name, xml, records};
    misc::XmlParseProblem problem;
    const bool parsed = misc::ParseXml(xml, size, &c, OnStart, OnAttribute, nullptr, OnEnd, nullptr, &problem);
    if (!problem.what.empty())
        OX_LOG(kChannel, diag::LogError, "%s:%u: %s", name, problem.line, problem.what.c_str());
    return parsed;
}

std::vector<uint32_t> BuildParticlesDump(std::vector<ParticleDesc> records)
{
    std::stable_sort(records.begin(), records.end(),
                     [](const ParticleDesc& a, const ParticleDesc& b) { return a.id.Compare(b.id.c_str()) < 0; });
    std::vector<uint32_t> dump(2 + records.size() * sizeof(ParticleDesc) / 4);
    dump[0] = kParticlesMagic;
    dump[1] = static_cast<uint32_t>(records.size());
    if (!records.empty())
        memcpy(&dump[2], records.data(), records.size() * sizeof(ParticleDesc));
    return dump;
}

CParticlesLoader::CParticlesLoader(misc::CGamePack* pack) : m_Pack(pack) {}

CParticlesLoader::~CParticlesLoader() { Release(); }

CParticlesLoader& CParticlesLoader::Instance()
{
    static auto* loader = new CParticlesLoader();
    return *loader;
}

void CParticlesLoader::Release()
{
    if (m_File)
        PackOf(m_Pack).Close(m_File);
    m_File = nullptr;
    m_Data = nullptr;
    m_Size = 0;
    m_Owned.clear();
    m_Owned.shrink_to_fit();
    m_FromXml = false;
}

uint32_t CParticlesLoader::Count() const { return m_Data ? reinterpret_cast<const uint32_t*>(m_Data)[1] : 0; }

const ParticleDesc* CParticlesLoader::Records() const
{
    return m_Data ? reinterpret_cast<const ParticleDesc*>(m_Data + 8) : nullptr;
}

const char* CParticlesLoader::CheckDump(const uint8_t* data, size_t size)
{
    if (size < 8)
        return "shorter than its header";
    uint32_t header[2];
    memcpy(header, data, sizeof header);
    if (header[0] != kParticlesMagic)
        return "another format";
    if ((size - 8) % sizeof(ParticleDesc) != 0 || header[1] != (size - 8) / sizeof(ParticleDesc))
        return "its record count does not match its size";
    return nullptr;
}

bool CParticlesLoader::LoadFromMemory(const void* data, size_t size, const char* name)
{
    Release();
    const auto* bytes = static_cast<const uint8_t*>(data);
    if (!bytes || reinterpret_cast<uintptr_t>(bytes) % 4 != 0) {
        OX_LOG(kChannel, diag::LogError, "'%s' is refused: no data, or not aligned to 4 bytes", name);
        return false;
    }
    if (const char* why = CheckDump(bytes, size)) {
        OX_LOG(kChannel, diag::LogError, "'%s' is refused: %s", name, why);
        return false;
    }
    const auto* records = reinterpret_cast<const ParticleDesc*>(bytes + 8);
    const uint32_t count = reinterpret_cast<const uint32_t*>(bytes)[1];
    for (uint32_t i = 0; i < count; ++i)
        if (!misc::IsStoredStringValid(records[i].id) || !misc::IsStoredStringValid(records[i].tex_id)) {
            OX_LOG(kChannel, diag::LogError, "'%s' is refused: record %u holds a broken id or texture id", name, i);
            return false;
        }
    m_Data = bytes;
    m_Size = size;
    return true;
}

void CParticlesLoader::LoadRecords(std::vector<ParticleDesc> records)
{
    Release();
    m_Owned = BuildParticlesDump(std::move(records));
    m_Data = reinterpret_cast<const uint8_t*>(m_Owned.data());
    m_Size = m_Owned.size() * 4;
    m_FromXml = true;
}

bool CParticlesLoader::Load()
{
    Release();
    misc::CGamePack& pack = PackOf(m_Pack);
    unsigned size = 0;
    const void* data = pack.Open(kParticlesBindump, &size);
    if (!data)
        return LoadXml();
    const auto* bytes = static_cast<const uint8_t*>(data);
    if (CheckDump(bytes, size)) {
        const int version = size >= 4 ? bytes[3] : 0;
        diag::message::ShowFormat("Error",
                                  "'%s' has wrong format version or is corrupted.\nSupported format: %i, format in "
                                  "bindump: %i",
                                  kParticlesBindump, static_cast<int>(kParticlesVersion), version);
        pack.Close(data);
        return false;
    }
    if (reinterpret_cast<uintptr_t>(data) % 4 == 0) {
        if (LoadFromMemory(data, size, kParticlesBindump))
            m_File = data;
        else
            pack.Close(data);
    } else {
        // A dump that does not lie on a 4-byte boundary is used from an aligned copy.
        std::vector<uint32_t> copy(size / 4);
        memcpy(copy.data(), data, size);
        pack.Close(data);
        if (LoadFromMemory(copy.data(), size, kParticlesBindump))
            m_Owned = std::move(copy);
    }
    return m_Data != nullptr;
}

bool CParticlesLoader::LoadXml()
{
    misc::CGamePack& pack = PackOf(m_Pack);
    std::vector<ParticleDesc> records;
    unsigned size = 0;
    std::vector<std::string> files;
    if (pack.Access(kParticlesXml))
        files.push_back(kParticlesXml);
    else
        pack.EnumFiles(kParticlesFolder, [](void* user, const char* path) {
            const size_t length = strlen(path);
            if (length > 4 && strcasecmp(path + length - 4, ".xml") == 0)
                static_cast<std::vector<std::string>*>(user)->push_back(path);
        }, &files);
    for (const std::string& file : files) {
        const void* xml = pack.Open(file.c_str(), &size);
        if (!xml || !ConvertParticlesXml(static_cast<const char*>(xml), size, file.c_str(), records))
            OX_LOG(kChannel, diag::LogError, "cannot read the particles of '%s'", file.c_str());
        if (xml)
            pack.Close(xml);
    }
    LoadRecords(std::move(records));
    OX_LOG(kChannel, diag::LogInfo, "%u particle systems loaded from %zu files", Count(), files.size());
    return true;
}

const ParticleDesc* CParticlesLoader::Find(const char* id) const
{
    OX_CHECK_DATA(m_Data != 0, nullptr);
    if (!id)
        return nullptr;
    const ParticleDesc* records = Records();
    int lo = 0, hi = static_cast<int>(Count()) - 1;
    while (lo <= hi) {
        const int mid = lo + (hi - lo) / 2;
        const int order = records[mid].id.Compare(id);
        if (order == 0)
            return &records[mid];
        if (order < 0)
            lo = mid + 1;
        else
            hi = mid - 1;
    }
    return nullptr;
}

bool CParticlesLoader::Save() const
{
    OX_CHECK_DATA(m_Data != 0, false);
    if (!m_FromXml)
        return false;
    const std::string path = misc::sys::NativePath(std::string(kParticlesBindump));
    if (misc::sys::WriteFileAtomically(path, m_Data, m_Size))
        return true;
    OX_LOG(kChannel, diag::LogError, "cannot write '%s'", path.c_str());
    return false;
}

} // namespace ox::core

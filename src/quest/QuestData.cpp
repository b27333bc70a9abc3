// The quest block: compiling quest.xml into it, walking it to build a level, and holding it.
#include "quest/QuestData.h"

#include "core/Settings.h"
#include "core/SettingsReaders.h"
#include "diag/Log.h"
#include "diag/Message.h"
#include "misc/GamePack.h"
#include "quest/Area.h"
#include "quest/ClipObject.h"
#include "quest/ImageObject.h"
#include "quest/Level.h"
#include "quest/SceneGroup.h"


#include <cstring>
#include <exception>

namespace qe {

namespace dump {

namespace {

constexpr const char* kChannel = "quest";
using ox::core::CSettingsGroup;
using ox::misc::StringA88;

bool Named(const CSettingsGroup& element, const char* name) { return element.GetId().view() == name; }
const std::string& Attr(const CSettingsGroup& element, const char* name) { return element.GetValue(name); }

// --- compiling ----------------------------------------------------------------------------

class Writer {
public:
    Writer(std::vector<uint8_t>& out, const char* file) : m_Out(out), m_File(file) {}

    size_t Size() const { return m_Out.size(); }
    void Rewind(size_t size) { m_Out.resize(size); }
    template <class T>
    size_t Put(const T& record)
    {
        size_t at = m_Out.size();
        const auto* bytes = reinterpret_cast<const uint8_t*>(&record);
        m_Out.insert(m_Out.end(), bytes, bytes + sizeof(T));
        return at;
    }
    // Writes `value` over the field at `offset` of the record written at `record`.
    template <class T>
    void Patch(size_t record, size_t offset, T value)
    {
        memcpy(m_Out.data() + record + offset, &value, sizeof(T));
    }
    void PutText(const std::string& text)
    {
        const uint32_t stored = StoredLength(text.size());
        m_Out.insert(m_Out.end(), text.begin(), text.end());
        m_Out.insert(m_Out.end(), stored - text.size(), 0);
    }
    // A text whose stored length must fit 16 bits; a longer one is cut, with a log line.
    std::string Short(const std::string& text, const std::string& owner) const
    {
        if (StoredLength(text.size()) <= 0xFFFF)
            return text;
        OX_LOG(kChannel, ox::diag::LogError, "%s: a script or hint of '%s' is longer than 65531 bytes and is cut",
               m_File, owner.c_str());
        return text.substr(0, 0xFFF8);
    }
    StringA88 Fixed(const std::string& text) const
    {
        StringA88 s;
        memset(static_cast<void*>(&s), 0, sizeof(s));
        // A fixed string ends at its first zero byte.
        size_t length = strnlen(text.c_str(), text.size());
        if (length >= StringA88::kCapacity) {
            OX_LOG(kChannel, ox::diag::LogError, "%s: the id '%s' is longer than %zu bytes and is cut", m_File,
                   text.c_str(), StringA88::kCapacity - 1);
            length = StringA88::kCapacity - 1;
        }
        memcpy(s.m_Data, text.data(), length);
        s.size = static_cast<uint16_t>(length);
        s.max_size = StringA88::kCapacity;
        s.hash = ox::misc::CalcHash(s.m_Data, length);
        return s;
    }
    const char* File() const { return m_File; }

private:
    std::vector<uint8_t>& m_Out;
    const char* m_File;
};

void Vector2(float (&out)[2], const CSettingsGroup& element, const char* name)
{
    ox::misc::Vector<float> v = ox::core::ReadVector(element, name);
    out[0] = v.X;
    out[1] = v.Y;
}

// An object header, then its strings. False when the element is no object this form holds.
bool PutObjectHeader(Writer& w, const CSettingsGroup& element, uint16_t kind)
{
    ObjectHeader header;
    memset(static_cast<void*>(&header), 0, sizeof(header));
    const std::string& id = Attr(element, "id");
    header.id = w.Fixed(id);
    header.objectFlags = static_cast<uint32_t>(ox::core::ReadInt(element, "object_flags"));
    const std::string hint = w.Short(Attr(element, "hint"), id);
    std::string scripts[4];
    for (int i = 0; i < 4; ++i) {
        scripts[i] = w.Short(Attr(element, ("s" + std::to_string(i + 1)).c_str()), id);
        header.scriptLength[i] = static_cast<uint16_t>(StoredLength(scripts[i].size()));
    }
    header.hintLength = static_cast<uint16_t>(StoredLength(hint.size()));
    header.kind = kind;
    w.Put(header);
    w.PutText(hint);
    for (const std::string& script : scripts)
        w.PutText(script);
    return true;
}

void PutColor(int16_t (&out)[4], const CSettingsGroup& element)
{
    ox::graphics::Color color(0, 0, 0, 0);
    ox::core::ReadColor(element, "color", color);
    out[0] = color.Red;
    out[1] = color.Green;
    out[2] = color.Blue;
    out[3] = color.Alpha;
}

// The kind of an element under `objects` or in a group; 0 for none.
uint16_t KindOf(const CSettingsGroup& element, const char* file)
{
    if (Named(element, "group"))
        return KindGroup;
    if (!Named(element, "object"))
        return 0;
    const std::string& type = Attr(element, "type");
    if (type == "image")
        return KindImage;
    if (type == "clip")
        return KindClip;
    OX_LOG(kChannel, ox::diag::LogError, "%s: object '%s' has the type '%s' (not image or clip) and is left out", file,
           Attr(element, "id").c_str(), type.c_str());
    return 0;
}

// The fields images and clips share, behind their resource id.
template <class Record>
void FillPicture(Writer& w, const CSettingsGroup& element, Record& record, ox::misc::StringA88& resource,
                 const char* idName)
{
    memset(static_cast<void*>(&record), 0, sizeof(record));
    resource = w.Fixed(Attr(element, idName));
    PutColor(record.color, element);
    Vector2(record.offset, element, "offset");
    Vector2(record.size, element, "size");
    record.angle = ox::core::ReadFloat(element, "angle");
}

void PutPicture(Writer& w, const CSettingsGroup& element, uint16_t kind)
{
    PutObjectHeader(w, element, kind);
    if (kind == KindImage) {
        ImageRecord record;
        FillPicture(w, element, record, record.imageId, "image_id");
        w.Put(record);
    } else {
        ClipRecord record;
        FillPicture(w, element, record, record.clipId, "clip_id");
        record.useAlpha = ox::core::ReadBool(element, "use_alpha") ? 1 : 0;
        w.Put(record);
    }
}

// One entry of a scene: an image, a clip, or a group with its states. False: left out.
bool PutEntry(Writer& w, const CSettingsGroup& element)
{
    const uint16_t kind = KindOf(element, w.File());
    if (kind == KindImage || kind == KindClip) {
        PutPicture(w, element, kind);
        return true;
    }
    if (kind != KindGroup)
        return false;
    PutObjectHeader(w, element, KindGroup);
    const size_t group = w.Put(GroupRecord {0, 0});
    uint32_t count = 0;
    for (const auto& child : element.GetChildren()) {
        const uint16_t childKind = KindOf(*child, w.File());
        if (childKind == KindImage || childKind == KindClip) {
            PutPicture(w, *child, childKind);
            ++count;
        } else if (childKind == KindGroup) {
            OX_LOG(kChannel, ox::diag::LogError, "%s: group '%s' holds a group, which is left out", w.File(),
                   Attr(element, "id").c_str());
        }
    }
    w.Patch(group, kGroupSizeAt, static_cast<uint32_t>(w.Size() - group));
    w.Patch(group, kGroupCountAt, count);
    return true;
}

bool PutArea(Writer& w, const CSettingsGroup& element)
{
    if (!Named(element, "area"))
        return false;
    PutObjectHeader(w, element, KindArea);
    AreaRecord record;
    memset(static_cast<void*>(&record), 0, sizeof(record));
    Vector2(record.offset, element, "offset");
    Vector2(record.size, element, "size");
    record.angle = ox::core::ReadFloat(element, "angle");
    const size_t at = w.Put(record);
    uint32_t count = 0;
    for (const auto& point : element.GetChildren()) {
        if (!Named(*point, "point"))
            continue;
        float xy[2] = {0, 0};
        Vector2(xy, *point, "offset");
        w.Put(xy);
        ++count;
    }
    w.Patch(at, kAreaPointCountAt, count);
    return true;
}

// Runs `put` on each child of `list`; a child whose values don't read is logged and left out.
template <class Put>
uint16_t PutEach(Writer& w, const CSettingsGroup* list, const std::string& scene, Put put)
{
    uint16_t count = 0;
    if (!list)
        return 0;
    for (const auto& child : list->GetChildren()) {
        const size_t start = w.Size();
        try {
            if (put(w, *child))
                ++count;
        } catch (const std::exception& e) {
            w.Rewind(start);
            OX_LOG(kChannel, ox::diag::LogError, "%s: scene '%s', object '%s': a value does not read (%s); left out",
                   w.File(), scene.c_str(), Attr(*child, "id").c_str(), e.what());
        }
    }
    return count;
}

void PutScene(Writer& w, const CSettingsGroup& element)
{
    SceneHeader header;
    memset(static_cast<void*>(&header), 0, sizeof(header));
    const std::string& id = Attr(element, "id");
    header.id = w.Fixed(id);
    try {
        header.flags = static_cast<uint32_t>(ox::core::ReadInt(element, "flags"));
        Vector2(header.size, element, "size");
        Vector2(header.offset, element, "offset");
    } catch (const std::exception& e) {
        OX_LOG(kChannel, ox::diag::LogError, "%s: scene '%s': a value does not read (%s)", w.File(), id.c_str(),
               e.what());
    }
    const std::string& script = Attr(element, "script");
    header.scriptLength = StoredLength(script.size());
    const size_t at = w.Put(header);
    w.PutText(script);
    const uint16_t objects = PutEach(w, element.GetChildRef("objects"), id, PutEntry);
    const uint16_t areas = PutEach(w, element.GetChildRef("areas"), id, PutArea);
    w.Patch(at, kSceneObjectCountAt, objects);
    w.Patch(at, kSceneAreaCountAt, areas);
    w.Patch(at, kSceneSizeAt, static_cast<uint32_t>(w.Size() - at));
}

void PutLevel(Writer& w, const CSettingsGroup& element)
{
    LevelHeader header;
    memset(static_cast<void*>(&header), 0, sizeof(header));
    const std::string& id = Attr(element, "id");
    header.id = w.Fixed(id);
    const std::string s1 = w.Short(Attr(element, "s1"), id);
    const std::string s2 = w.Short(Attr(element, "s2"), id);
    header.s1Length = static_cast<uint16_t>(StoredLength(s1.size()));
    header.s2Length = static_cast<uint16_t>(StoredLength(s2.size()));
    const size_t at = w.Put(header);
    w.PutText(s1);
    w.PutText(s2);
    uint32_t scenes = 0;
    for (const auto& child : element.GetChildren())
        if (Named(*child, "scene")) {
            PutScene(w, *child);
            ++scenes;
        }
    w.Patch(at, kLevelSceneCountAt, scenes);
    w.Patch(at, kLevelSizeAt, static_cast<uint32_t>(w.Size() - at));
}

} // namespace

std::vector<uint8_t> Compile(const CSettingsGroup& quest, const char* file)
{
    std::vector<uint8_t> block;
    Writer w(block, file);
    w.Put(kMagic);
    for (const auto& child : quest.GetChildren())
        if (Named(*child, "level"))
            PutLevel(w, *child);
    return block;
}

} // namespace dump

// --- reading ----------------------------------------------------------------------------------

namespace dump {

namespace {

// A bounded walk over the block. Records are copied out, so nothing relies on alignment; a
// read past the end fails and the reader gives up on the block it is in.
class Reader {
public:
    Reader(const uint8_t* begin, const uint8_t* end) : m_At(begin), m_End(end) {}

    const uint8_t* At() const { return m_At; }
    size_t Left() const { return static_cast<size_t>(m_End - m_At); }
    template <class T>
    bool Take(T& record)
    {
        if (Left() < sizeof(T))
            return false;
        memcpy(static_cast<void*>(&record), m_At, sizeof(T));
        m_At += sizeof(T);
        return true;
    }
    bool Text(uint32_t stored, std::string& text)
    {
        if (stored % 4 != 0 || Left() < stored)
            return false;
        const char* chars = reinterpret_cast<const char*>(m_At);
        text.assign(chars, strnlen(chars, stored));
        m_At += stored;
        return true;
    }
    bool Skip(size_t bytes)
    {
        if (Left() < bytes)
            return false;
        m_At += bytes;
        return true;
    }

private:
    const uint8_t* m_At;
    const uint8_t* m_End;
};

bool IdOf(const StringA88& stored, std::string& id)
{
    if (!ox::misc::IsStoredStringValid(stored))
        return false;
    id.assign(stored.m_Data, stored.size);
    return true;
}

FloatVector Vec(const float (&xy)[2]) { return {xy[0], xy[1]}; }
ox::graphics::Color ColorOf(const int16_t (&c)[4]) { return ox::graphics::Color(c[0], c[1], c[2], c[3]); }

// An object header with its strings, set on `object`; the kind comes back in `kind`.
bool ReadCommon(Reader& r, BaseSceneObjectPtrT& object, uint16_t& kind)
{
    ObjectHeader header;
    std::string id, hint, scripts[4];
    if (!r.Take(header) || !IdOf(header.id, id) || !r.Text(header.hintLength, hint))
        return false;
    for (int i = 0; i < 4; ++i)
        if (!r.Text(header.scriptLength[i], scripts[i]))
            return false;
    kind = header.kind;
    if (kind == KindImage)
        object.reset(new CImageObject());
    else if (kind == KindClip)
        object.reset(new CClipObject());
    else if (kind == KindGroup)
        object.reset(new CSceneGroup());
    else if (kind == KindArea)
        object.reset(new CArea());
    else
        return false;
    object->SetId(id);
    object->SetObjectFlags(header.objectFlags);
    object->SetHint(hint);
    for (int i = 0; i < 4; ++i)
        object->SetLuaScript(scripts[i], i);
    return true;
}

template <class Record>
void PlacePicture(CObject& object, const Record& record)
{
    object.SetColor(ColorOf(record.color));
    object.SetPos(Vec(record.offset));
    object.SetSize(Vec(record.size));
    object.SetAngle(record.angle);
}

// An image or a clip: the header, then its record; binding the texture or clip loads it.
BaseSceneObjectPtrT ReadPicture(Reader& r, bool inGroup)
{
    BaseSceneObjectPtrT object;
    uint16_t kind = 0;
    if (!ReadCommon(r, object, kind))
        return nullptr;
    std::string resource;
    if (kind == KindImage) {
        ImageRecord record;
        if (!r.Take(record) || !IdOf(record.imageId, resource))
            return nullptr;
        auto* image = static_cast<CImageObject*>(object.get());
        image->SetTextureId(resource);
        PlacePicture(*image, record);
    } else if (kind == KindClip) {
        ClipRecord record;
        if (!r.Take(record) || !IdOf(record.clipId, resource))
            return nullptr;
        auto* clip = static_cast<CClipObject*>(object.get());
        clip->SetClipId(resource);
        clip->UseAlpha(record.useAlpha != 0);
        PlacePicture(*clip, record);
    } else if (inGroup || kind != KindGroup) {
        return nullptr;
    }
    return object;
}

// A group's states follow its record; the record's size bounds them.
bool ReadGroupStates(Reader& r, CSceneGroup& group)
{
    GroupRecord record;
    const uint8_t* start = r.At();
    if (!r.Take(record) || record.size < sizeof(record) || record.size > r.Left() + sizeof(record))
        return false;
    Reader states(r.At(), start + record.size);
    const CBaseSceneObject* last = nullptr;
    for (uint32_t i = 0; i < record.count; ++i) {
        BaseSceneObjectPtrT state = ReadPicture(states, true);
        if (!state)
            return false;
        group.InsertChild(state, last);
        last = state.get();
    }
    return r.Skip(record.size - sizeof(record));
}

bool ReadArea(Reader& r, BaseSceneObjectPtrT& object)
{
    uint16_t kind = 0;
    AreaRecord record;
    if (!ReadCommon(r, object, kind) || kind != KindArea || !r.Take(record) || record.pointCount > r.Left() / 8)
        return false;
    auto& area = static_cast<CArea&>(*object);
    const CAreaPoint* last = nullptr;
    for (uint32_t i = 0; i < record.pointCount; ++i) {
        float xy[2];
        r.Take(xy);
        AreaPointPtrT point(new CAreaPoint(Vec(xy)));
        area.InsertPoint(point, last);
        last = point.get();
    }
    return true;
}

// The objects and areas of a scene, in file order. False at the first entry that does not
// read (what came before it stays).
bool ReadSceneEntries(Reader& r, const SceneHeader& header, CScene& scene)
{
    const CBaseSceneObject* last = nullptr;
    for (unsigned i = 0; i < header.objectCount; ++i) {
        BaseSceneObjectPtrT object = ReadPicture(r, false);
        if (!object || (object->GetType() == CBaseSceneObject::GroupType &&
                        !ReadGroupStates(r, static_cast<CSceneGroup&>(*object))))
            return false;
        scene.InsertObject(object, last);
        last = object.get();
    }
    last = nullptr;
    for (unsigned i = 0; i < header.areaCount; ++i) {
        BaseSceneObjectPtrT area;
        if (!ReadArea(r, area))
            return false;
        scene.InsertArea(area, last);
        last = area.get();
    }
    return true;
}

constexpr const char* kDamaged = "quest data: level '%s': %s is damaged; the rest of it is left out";

// The scenes of a level; a damaged scene is logged, and the walk goes on behind it when its
// stored size can be trusted.
void ReadScenes(Reader& r, uint32_t count, CLevel& level)
{
    const CScene* last = nullptr;
    const uint8_t* end = r.At() + r.Left();
    for (uint32_t i = 0; i < count; ++i) {
        const uint8_t* start = r.At();
        SceneHeader header;
        std::string id, script;
        if (!r.Take(header) || !IdOf(header.id, id) || header.sceneSize < sizeof(header) ||
            header.sceneSize - sizeof(header) > r.Left() || !r.Text(header.scriptLength, script)) {
            OX_LOG(kChannel, ox::diag::LogError, kDamaged, level.GetId().c_str(), "a scene header");
            return;
        }
        ScenePtrT scene(new CScene());
        scene->SetId(id);
        scene->SetFlags(header.flags);
        scene->SetSize(Vec(header.size));
        scene->SetOffset(Vec(header.offset));
        scene->SetScript(script);
        Reader entries(r.At(), start + header.sceneSize);
        if (!ReadSceneEntries(entries, header, *scene))
            OX_LOG(kChannel, ox::diag::LogError, "quest data: level '%s', scene '%s': an object is damaged; the "
                   "objects behind it are left out", level.GetId().c_str(), id.c_str());
        scene->UpdateTotalChildList();
        level.InsertScene(scene, last);
        last = scene.get();
        r = Reader(start + header.sceneSize, end);
    }
}

} // namespace

namespace {

// Walks the level blocks, calling `visit(header, begin, end)` for each until it returns true.
// A block whose size does not fit is logged and ends the walk.
template <class Visit>
void EachLevel(const uint8_t* data, size_t size, Visit visit)
{
    if (!data || size < 4)
        return;
    Reader r(data + 4, data + size);
    while (r.Left() > 0) {
        const uint8_t* start = r.At();
        LevelHeader header;
        if (!r.Take(header) || header.size < sizeof(header) || header.size - sizeof(header) > r.Left()) {
            OX_LOG(kChannel, ox::diag::LogError, "quest data: the level block at byte %zu is damaged; no level "
                   "behind it is read", static_cast<size_t>(start - data));
            return;
        }
        if (visit(header, start, start + header.size))
            return;
        r = Reader(start + header.size, data + size);
    }
}

} // namespace

CLevel* BuildLevel(const uint8_t* data, size_t size, const char* id)
{
    CLevel* level = nullptr;
    const size_t length = strlen(id);
    EachLevel(data, size, [&](const LevelHeader& header, const uint8_t* begin, const uint8_t* end) {
        if (header.id.size != length || memcmp(header.id.m_Data, id, length) != 0)
            return false;
        level = new CLevel();
        level->SetId(id);
        Reader r(begin + sizeof(header), end);
        std::string s1, s2;
        if (!r.Text(header.s1Length, s1) || !r.Text(header.s2Length, s2)) {
            OX_LOG(kChannel, ox::diag::LogError, kDamaged, id, "the level header");
            return true;
        }
        level->SetLuaScript(s1, CLevel::ScriptLevel);
        level->SetLuaScript(s2, CLevel::ScriptStart);
        ReadScenes(r, header.sceneCount, *level);
        return true;
    });
    return level;
}

std::string Describe(const void* data, size_t size, bool* intact)
{
    const auto* bytes = static_cast<const uint8_t*>(data);
    uint32_t magic = 0;
    if (size >= 4)
        memcpy(&magic, bytes, 4);
    bool ok = magic == kMagic;
    if (intact)
        *intact = ok;
    if (!ok)
        return "not a quest dump (wrong magic)\n";
    std::string text;
    char line[256];
    const uint8_t* reached = bytes + 4;
    EachLevel(bytes, size, [&](const LevelHeader& header, const uint8_t* begin, const uint8_t* end) {
        reached = end;
        std::string id;
        IdOf(header.id, id);
        snprintf(line, sizeof(line), "level '%s': %u scenes, %u bytes\n", id.c_str(), header.sceneCount, header.size);
        text += line;
        Reader r(begin + sizeof(header), end);
        std::string script;
        if (!r.Text(header.s1Length, script) || !r.Text(header.s2Length, script)) {
            text += "  a damaged level header\n";
            ok = false;
            return false;
        }
        for (uint32_t i = 0; i < header.sceneCount; ++i) {
            const uint8_t* start = r.At();
            SceneHeader scene;
            if (!r.Take(scene) || !IdOf(scene.id, id) || scene.sceneSize < sizeof(scene) ||
                scene.sceneSize - sizeof(scene) > r.Left()) {
                text += "  a damaged scene\n";
                ok = false;
                return false;
            }
            snprintf(line, sizeof(line), "  scene '%s': flags %u, %u objects, %u areas, %u bytes\n", id.c_str(),
                     scene.flags, scene.objectCount, scene.areaCount, scene.sceneSize);
            text += line;
            r = Reader(start + scene.sceneSize, end);
        }
        return false;
    });
    if (reached != bytes + size) {
        snprintf(line, sizeof(line), "a damaged level block at byte %zu\n", static_cast<size_t>(reached - bytes));
        text += line;
        ok = false;
    }
    if (intact)
        *intact = ok;
    return text;
}

} // namespace dump

// --- the holder -------------------------------------------------------------------------------

void CQuestData::Release()
{
    if (m_Data && !m_Owned)
        Pack().Close(m_Data);
    m_Data = nullptr;
    m_Size = 0;
    m_Owned = false;
    m_Block.clear();
    m_Block.shrink_to_fit();
}

ox::misc::CGamePack& CQuestData::Pack() const { return m_Pack ? *m_Pack : ox::misc::g_GamePack::Instance(); }

void CQuestData::SetBlock(std::vector<uint8_t> block)
{
    Release();
    m_Block = std::move(block);
    m_Data = m_Block.data();
    m_Size = m_Block.size();
    m_Owned = true;
}

void CQuestData::Load()
{
    Release();
    unsigned size = 0;
    if (const void* data = Pack().Open(kBindump, &size)) {
        uint32_t magic = 0;
        if (size >= 4)
            memcpy(&magic, data, 4);
        if (magic == dump::kMagic) {
            m_Data = static_cast<const uint8_t*>(data);
            m_Size = size;
            m_Owned = false;
            OX_LOG("quest", ox::diag::LogInfo, "Quest data: %s, %u bytes", kBindump, size);
            return;
        }
        Pack().Close(data);
        ox::diag::message::Show("Error", "quest.bindump has incompatible version.");
        return;
    }
    const void* xml = Pack().Open(kXml, &size);
    if (!xml) {
        OX_LOG("quest", ox::diag::LogError, "Quest data: neither %s nor %s exists; the game has no levels", kBindump,
               kXml);
        return;
    }
    ox::core::CSettings settings;
    const bool parsed = settings.LoadXmlFromMemory(static_cast<const char*>(xml), size, kXml);
    Pack().Close(xml);
    if (!parsed)
        return;
    SetBlock(dump::Compile(settings.GetChild("Quest"), kXml));
    OX_LOG("quest", ox::diag::LogInfo, "Quest data: %s compiled, %zu bytes", kXml, m_Size);
}

CLevel* CQuestData::CreateLevel(const char* id) const
{
    if (!m_Data || !id)
        return nullptr;
    return dump::BuildLevel(m_Data, m_Size, id);
}

CQuestData& g_QuestData::Instance()
{
    static CQuestData data;
    return data;
}

} // namespace qe

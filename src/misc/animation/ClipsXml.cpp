// The XML form of clips, converted into the records of the bulk. The game builds its bulk
// with this when there is no dump, and the dump tool writes the dump with it.
#include "misc/animation/ClipsLoader.h"

#include "diag/Log.h"
#include "misc/XmlParser.h"

#include <algorithm>
#include <climits>
#include <cstdlib>
#include <cstring>
#include <optional>
#include <string_view>

namespace ox::misc::anim {

namespace {

constexpr const char* kChannel = "anim";
constexpr size_t kMaxValueLength = 1024;
constexpr size_t kMaxKeyLength = 55;

// A missing attribute is zeroed memory: colours too are zero (transparent black), not the
// white a colour starts as.
constexpr graphics::Color kZeroColor(0u);

struct PendingObject {
    ClipObjectBase base {};
    std::vector<uint8_t> extension;
    std::vector<KeyState> keys;
    std::vector<SoundPoint> sounds;
    std::vector<PathPoint> points;
    // Entries past the 255 a count can hold: key states, sound points, path points.
    unsigned dropped[3] = {};
    bool usable = true;
    int depth = 0;
};

struct PendingClip {
    ClipRecord header {};
    std::vector<uint8_t> objects;
    bool usable = true;
    int depth = 0;
};

struct Conversion {
    const char* name;
    ClipRecords* clips;
    std::map<std::string, std::string, std::less<>> attributes;  // of the element being opened
    std::optional<PendingClip> clip;
    std::optional<PendingObject> object;
    int skipDepth = -1;  // an element left out with everything inside it

    const char* ClipId() const { return clip ? clip->header.id.c_str() : ""; }
    const char* ObjectId() const { return object ? object->base.id.c_str() : ""; }
    const std::string* Attribute(std::string_view name) const
    {
        auto it = attributes.find(name);
        return it == attributes.end() ? nullptr : &it->second;
    }
};

// Numbers and lists ----------------------------------------------------------------------

bool IsSeparator(char c) { return c == ',' || c == ';' || c == ' ' || c == '\t' || c == '\r' || c == '\n'; }

// Up to `count` floats separated by commas, semicolons or blanks; the rest stay 0.
void ReadFloats(const std::string& text, float* out, size_t count)
{
    const char* p = text.c_str();
    for (size_t i = 0; i < count; ++i) {
        while (IsSeparator(*p))
            ++p;
        char* end = nullptr;
        const float value = strtof(p, &end);
        if (end == p)
            return;
        out[i] = value;
        p = end;
    }
}

int32_t ToInt(const std::string& text)
{
    return static_cast<int32_t>(std::clamp(strtoll(text.c_str(), nullptr, 10), (long long)INT_MIN, (long long)INT_MAX));
}

// Decimal, or hexadecimal after "0x" (colours read best that way).
uint32_t ToUnsigned(const std::string& text)
{
    const char* p = text.c_str();
    while (*p == ' ')
        ++p;
    const bool hex = p[0] == '0' && (p[1] == 'x' || p[1] == 'X');
    return static_cast<uint32_t>(strtoull(hex ? p + 2 : p, nullptr, hex ? 16 : 10));
}

// Attributes into fields: a missing attribute leaves the field as it is (zero).
struct Reader {
    const Conversion& c;

    void Float(const char* name, float& out) const
    {
        if (const std::string* v = c.Attribute(name))
            ReadFloats(*v, &out, 1);
    }
    void Floats(const char* name, float* out, size_t count) const
    {
        if (const std::string* v = c.Attribute(name))
            ReadFloats(*v, out, count);
    }
    void Vector(const char* name, FloatVector& out) const { Floats(name, &out.X, 2); }
    void Poly(const char* name, Poly4& out) const
    {
        float values[8] = {};
        if (const std::string* v = c.Attribute(name)) {
            ReadFloats(*v, values, 8);
            for (int i = 0; i < 4; ++i)
                out[i] = {values[2 * i], values[2 * i + 1]};
        }
    }
    void Int(const char* name, int32_t& out) const
    {
        if (const std::string* v = c.Attribute(name))
            out = ToInt(*v);
    }
    void Unsigned(const char* name, uint32_t& out) const
    {
        if (const std::string* v = c.Attribute(name))
            out = ToUnsigned(*v);
    }
    void Colour(const char* name, graphics::Color& out) const
    {
        if (const std::string* v = c.Attribute(name))
            out = graphics::Color(ToUnsigned(*v));
    }
    // Only the exact text "true" is true.
    void Bool(const char* name, uint8_t& out) const
    {
        if (const std::string* v = c.Attribute(name))
            out = *v == "true" ? 1 : 0;
    }
    // A text into a fixed string; false (logged, naming `what`) when it does not fit.
    template <size_t N>
    bool Text(const char* name, String<char, N>& out, const char* what, size_t limit = N - 1) const
    {
        const std::string* v = c.Attribute(name);
        if (!v) {
            out.Hash();  // every string of a record carries its hash, the empty one too
            return true;
        }
        if (v->size() > limit) {
            OX_LOG(kChannel, diag::LogError, "%s: clip '%s': the %s '%s' is longer than %zu bytes", c.name, c.ClipId(),
                   what, v->c_str(), limit);
            return false;
        }
        out = std::string_view(*v);
        out.Hash();
        return true;
    }
};

// Elements -------------------------------------------------------------------------------

ClipObjectType ObjectTypeOf(std::string_view element)
{
    static const std::pair<std::string_view, ClipObjectType> kinds[] = {
        {"path", PathType}, {"image", ImageType}, {"particle", ParticleType}, {"clip", ClipType}, {"text", TextType}};
    for (const auto& [name, type] : kinds)
        if (element == name)
            return type;
    return UnknownType;
}

void StartClip(Conversion& c, int depth)
{
    c.clip.emplace();
    PendingClip& clip = *c.clip;
    clip.depth = depth;
    const Reader read {c};
    const std::string* id = c.Attribute("id");
    if (!id || id->empty() || !read.Text("id", clip.header.id, "clip id")) {
        OX_LOG(kChannel, diag::LogError, "%s: a clip without a usable id is left out", c.name);
        clip.usable = false;
    }
    read.Float("x", clip.header.x);
    read.Float("y", clip.header.y);
    read.Float("w", clip.header.w);
    read.Float("h", clip.header.h);
}

template <class T>
std::vector<uint8_t> BytesOf(const T& value)
{
    const auto* p = reinterpret_cast<const uint8_t*>(&value);
    return std::vector<uint8_t>(p, p + sizeof(T));
}

// The extension of a type as the element's attributes give it; false when a text does not fit.
bool ReadExtension(const Reader& read, ClipObjectType type, std::vector<uint8_t>& out)
{
    bool ok = true;
    switch (type) {
    case ImageType: {
        ImageExtension e {};
        ok = read.Text("i_id", e.image, "image id");
        out = BytesOf(e);
        break;
    }
    case ClipType: {
        ClipViewExtension e {};
        ok = read.Text("clip_id", e.clip, "clip id");
        out = BytesOf(e);
        break;
    }
    case ParticleType: {
        ParticleExtension e {};
        ok = read.Text("p_id", e.system, "particle system id");
        read.Int("adv_time", e.adv_time);
        read.Bool("fix_emit", e.fix_emit);
        read.Bool("scale", e.scale);
        out = BytesOf(e);
        break;
    }
    case TextType: {
        TextExtension e {};
        e.bk_color = kZeroColor;
        ok = read.Text("ft", e.font, "font id") && read.Text("bk", e.background, "background image id") &&
             read.Text("tx", e.key, "text key", kMaxKeyLength);
        read.Unsigned("tx_fl", e.tx_fl);
        read.Floats("bnd", &e.bounds.X, 4);
        read.Colour("bk_c", e.bk_color);
        read.Floats("ins", &e.insets.left, 4);
        out = BytesOf(e);
        break;
    }
    case PathType: {
        PathExtension e {};
        int32_t closed = 0;
        read.Int("closed", closed);
        e.closed = static_cast<uint8_t>(std::clamp(closed, 0, 255));
        out = BytesOf(e);
        break;
    }
    default:
        break;
    }
    return ok;
}

void StartObject(Conversion& c, ClipObjectType type, int depth)
{
    c.object.emplace();
    PendingObject& object = *c.object;
    object.depth = depth;
    ClipObjectBase& base = object.base;
    base.type = type;
    base.color = kZeroColor;
    const Reader read {c};
    object.usable = read.Text("id", base.id, "object id") && read.Text("path", base.path, "path id") &&
                    ReadExtension(read, type, object.extension);
    read.Bool("snap", base.snap);
    read.Vector("p", base.pos);
    read.Poly("py", base.contour);
    read.Float("a", base.angle);
    read.Colour("c", base.color);
    read.Bool("add_b", base.additive);
    read.Unsigned("flip", base.flip);
    read.Unsigned("uflags", base.user_flags);
    read.Bool("vis", base.visible);
    read.Unsigned("at", base.anim_type);
    read.Unsigned("ad", base.anim_dir);
}

// Whether one more entry of a one-byte count fits; one that does not is counted.
template <class T>
bool RoomFor(PendingObject& object, const std::vector<T>& list, unsigned kind)
{
    if (list.size() < kMaxRecordCount)
        return true;
    ++object.dropped[kind];
    return false;
}

void AddKey(Conversion& c)
{
    PendingObject& object = *c.object;
    if (!RoomFor(object, object.keys, 0))
        return;
    const Reader read {c};
    KeyState key {};
    key.color = kZeroColor;
    read.Int("t", key.t);
    read.Bool("itpl", key.itpl);
    read.Vector("p", key.pos);
    read.Float("k", key.k);
    read.Poly("py", key.contour);
    read.Float("a", key.angle);
    read.Colour("c", key.color);
    read.Unsigned("fl", key.flip);
    read.Unsigned("cf", key.custom);
    object.keys.push_back(key);
}

void AddSound(Conversion& c)
{
    PendingObject& object = *c.object;
    if (!RoomFor(object, object.sounds, 1))
        return;
    const Reader read {c};
    SoundPoint sound {};
    read.Int("k", sound.k);
    if (read.Text("id", sound.id, "sound id"))
        object.sounds.push_back(sound);
}

void AddPoint(Conversion& c)
{
    PendingObject& object = *c.object;
    if (object.base.type != PathType) {
        OX_LOG(kChannel, diag::LogError, "%s: clip '%s': object '%s' is not a path; its point is ignored", c.name,
               c.ClipId(), c.ObjectId());
        return;
    }
    if (!RoomFor(object, object.points, 2))
        return;
    const Reader read {c};
    PathPoint point {};
    read.Vector("a", point.a);
    read.Vector("p1", point.p1);
    read.Vector("p2", point.p2);
    object.points.push_back(point);
}

template <class T>
void Append(std::vector<uint8_t>& out, const T* items, size_t count)
{
    const auto* p = reinterpret_cast<const uint8_t*>(items);
    out.insert(out.end(), p, p + count * sizeof(T));
}

void FinishObject(Conversion& c)
{
    PendingObject& object = *c.object;
    PendingClip& clip = *c.clip;
    if (!object.usable || !clip.usable) {
        OX_LOG(kChannel, diag::LogError, "%s: clip '%s': object '%s' is left out", c.name, c.ClipId(), c.ObjectId());
        return;
    }
    static const char* const kinds[] = {"key states", "sound points", "path points"};
    for (unsigned kind = 0; kind < 3; ++kind)
        if (object.dropped[kind])
            OX_LOG(kChannel, diag::LogError, "%s: clip '%s': object '%s' has more than 255 %s; %u are left out",
                   c.name, c.ClipId(), c.ObjectId(), kinds[kind], object.dropped[kind]);
    ClipObjectBase& base = object.base;
    if (base.type == PathType)
        reinterpret_cast<PathExtension*>(object.extension.data())->points = static_cast<uint8_t>(object.points.size());
    base.keypointsnum = static_cast<uint8_t>(object.keys.size());
    base.soundpointsnum = static_cast<uint8_t>(object.sounds.size());
    std::vector<uint8_t> bytes;
    Append(bytes, &base, 1);
    Append(bytes, object.extension.data(), object.extension.size());
    Append(bytes, object.points.data(), object.points.size());
    Append(bytes, object.keys.data(), object.keys.size());
    Append(bytes, object.sounds.data(), object.sounds.size());
    // Room for the clip's header and end mark.
    if (sizeof(ClipRecord) + clip.objects.size() + bytes.size() + 4 >= kMaxClipSize) {
        OX_LOG(kChannel, diag::LogError, "%s: clip '%s': object '%s' does not fit in a clip of %u bytes; left out",
               c.name, c.ClipId(), c.ObjectId(), kMaxClipSize);
        return;
    }
    const auto size = static_cast<uint32_t>(bytes.size());
    memcpy(bytes.data(), &size, 4);
    clip.objects.insert(clip.objects.end(), bytes.begin(), bytes.end());
}

void FinishClip(Conversion& c)
{
    PendingClip& clip = *c.clip;
    if (!clip.usable)
        return;
    clip.header.size = static_cast<uint32_t>(sizeof(ClipRecord) + clip.objects.size() + 4);
    std::vector<uint32_t> record(clip.header.size / 4, 0);
    auto* bytes = reinterpret_cast<uint8_t*>(record.data());
    memcpy(bytes, &clip.header, sizeof(ClipRecord));
    if (!clip.objects.empty())
        memcpy(bytes + sizeof(ClipRecord), clip.objects.data(), clip.objects.size());
    const std::string id = clip.header.id.c_str();
    if (c.clips->count(id))
        OX_LOG(kChannel, diag::LogWarning, "%s: clip '%s' is given twice; the last one holds", c.name, id.c_str());
    (*c.clips)[id] = std::move(record);
}

// Parser callbacks ----------------------------------------------------------------------

std::string_view ElementName(const XmlRecord* stack, int depth) { return {stack[depth].name, stack[depth].nameLength}; }

void OnStart(void* user, XmlRecord*, int) { static_cast<Conversion*>(user)->attributes.clear(); }

void OnAttribute(void* user, XmlRecord*, int, const char* name, size_t nameLength, const char* value,
                 size_t valueLength, bool)
{
    auto& c = *static_cast<Conversion*>(user);
    if (valueLength >= kMaxValueLength) {
        OX_LOG(kChannel, diag::LogError, "%s: clip '%s': the value of '%.*s' is longer than 1023 bytes; ignored",
               c.name, c.ClipId(), static_cast<int>(nameLength), name);
        return;
    }
    // Texts of the records end at their first zero byte.
    c.attributes[std::string(name, strnlen(name, nameLength))] = std::string(value, strnlen(value, valueLength));
}

void OnObjectChild(Conversion& c, std::string_view element, int depth)
{
    if (element == "kp")
        AddKey(c);
    else if (element == "sd")
        AddSound(c);
    else if (element == "p")
        AddPoint(c);
    else {
        OX_LOG(kChannel, diag::LogWarning, "%s: clip '%s': object '%s' holds an unknown element '%.*s'; ignored",
               c.name, c.ClipId(), c.ObjectId(), static_cast<int>(element.size()), element.data());
        c.skipDepth = depth;
    }
}

void OnAttributesDone(void* user, XmlRecord* stack, int depth)
{
    auto& c = *static_cast<Conversion*>(user);
    const std::string_view element = ElementName(stack, depth);
    if (c.skipDepth >= 0)
        return;
    if (!c.clip) {
        if (element == "Clip")
            StartClip(c, depth);
        return;
    }
    if (depth == c.clip->depth + 1) {
        const ClipObjectType type = ObjectTypeOf(element);
        if (type != UnknownType) {
            StartObject(c, type, depth);
            return;
        }
        OX_LOG(kChannel, diag::LogError, "%s: clip '%s': unknown object kind '%.*s' is left out", c.name, c.ClipId(),
               static_cast<int>(element.size()), element.data());
        c.skipDepth = depth;
    } else if (c.object && depth == c.object->depth + 1) {
        OnObjectChild(c, element, depth);
    } else {
        c.skipDepth = depth;
    }
}

void OnEnd(void* user, XmlRecord*, int depth)
{
    auto& c = *static_cast<Conversion*>(user);
    // A broken document may close an outer element first: what was open inside it ends too.
    if (c.skipDepth >= 0) {
        if (depth > c.skipDepth)
            return;
        const bool skipped = depth == c.skipDepth;
        c.skipDepth = -1;
        if (skipped)
            return;
    }
    if (c.object && depth <= c.object->depth) {
        if (depth == c.object->depth)
            FinishObject(c);
        c.object.reset();
    }
    if (c.clip && depth <= c.clip->depth) {
        if (depth == c.clip->depth)
            FinishClip(c);
        c.clip.reset();
    }
}

} // namespace

bool ConvertClipsXml(const char* xml, size_t size, const char* name, ClipRecords& clips)
{
    // A document that fails to parse adds nothing.
    ClipRecords converted;
    Conversion c {name, &converted, {}, {}, {}};
    XmlParseProblem problem;
    const bool parsed = ParseXml(xml, size, &c, OnStart, OnAttribute, OnAttributesDone, OnEnd, nullptr, &problem);
    if (!parsed || !problem.what.empty()) {
        OX_LOG(kChannel, diag::LogError, "Cannot read clips '%s': line %u: %s", name, problem.line,
               problem.what.empty() ? "not an XML file" : problem.what.c_str());
        return false;
    }
    for (auto& [id, record] : converted) {
        if (clips.count(id))
            OX_LOG(kChannel, diag::LogWarning, "%s: clip '%s' was given before; this one holds", name, id.c_str());
        clips[id] = std::move(record);
    }
    return true;
}

} // namespace ox::misc::anim

// The texture declarations' XML form (properties/resources.xml) converted into the bulk the
// game reads in place; image sizes and formats the document leaves out come from the files.
#include "core/TextureDeclarations.h"

#include "diag/Log.h"
#include "misc/GamePack.h"
#include "misc/XmlParser.h"
#include "misc/imagelib/ImageLib.h"
#include "misc/imagelib/PvrContainer.h"

#include <algorithm>
#include <cstring>
#include <map>
#include <memory>
#include <string>
#include <string_view>

namespace ox::core {

namespace {

using Loader = CTextureDeclarationsLoader;
constexpr const char* kChannel = Loader::LogChannel;
using graphics::TextureDesc;
using graphics::UVRect;

bool EndsWith(std::string_view text, std::string_view tail)
{
    return text.size() >= tail.size() && text.compare(text.size() - tail.size(), tail.size(), tail) == 0;
}

template <size_t N>
void SetString(misc::String<char, N>& s, std::string_view text)
{
    s = text.substr(0, N - 1);
    s.hash = 0;
    s.Hash();
}

struct PartRect {
    int x = 0, y = 0, w = 0, h = 0;
};

struct PendingImage {
    std::string id;
    std::string path;
    uint32_t animType = 0;
    int cols = 0, rows = 0;
    bool hasCols = false, hasRows = false;
    std::vector<int> frameMap;
    bool hasFrameMap = false;
    std::vector<int> delays;
    std::vector<PartRect> parts;
    uint32_t group = 0;
    uint32_t groupFlags = 0;
    unsigned line = 0;
};

struct Conversion {
    misc::CGamePack* pack;
    const char* name;
    std::vector<Loader::SurfaceRecord> surfaces;
    bool surfacesClosed = false;
    std::vector<Loader::GroupRecord> groups;
    std::vector<uint32_t> groupStack;  // offsets of the open groups
    std::map<std::string, std::vector<uint8_t>> images;  // id -> description bytes
    std::map<std::string, uint32_t> imageGroups;
    std::map<std::string, std::string> attributes;  // of the element being opened
    PendingImage image;
    bool inImage = false;
    bool failed = false;

    uint32_t GroupsBegin() const
    {
        return static_cast<uint32_t>(sizeof(Loader::Header) + surfaces.size() * sizeof(Loader::SurfaceRecord));
    }
    uint32_t SurfaceOffset(size_t index) const
    {
        return static_cast<uint32_t>(sizeof(Loader::Header) + index * sizeof(Loader::SurfaceRecord));
    }
    void CloseSurfaces()
    {
        if (surfacesClosed)
            return;
        std::stable_sort(surfaces.begin(), surfaces.end(), [](const auto& a, const auto& b) {
            return Loader::CompareIds(a.path.c_str(), b.path.c_str()) < 0;
        });
        surfacesClosed = true;
    }
    int FindSurface(const std::string& path) const
    {
        auto it = std::lower_bound(surfaces.begin(), surfaces.end(), path, [](const auto& s, const std::string& p) {
            return Loader::CompareIds(s.path.c_str(), p.c_str()) < 0;
        });
        if (it == surfaces.end() || path != it->path.c_str())
            return -1;
        return static_cast<int>(it - surfaces.begin());
    }
};

std::string_view ElementName(const misc::XmlRecord* stack, int depth)
{
    return {stack[depth].name, stack[depth].nameLength};
}

int ToInt(const std::string& text)
{
    return static_cast<int>(std::clamp(strtol(text.c_str(), nullptr, 10), -0x7FFFFFFFL, 0x7FFFFFFFL));
}

std::vector<int> ToIntList(const std::string& text)
{
    std::vector<int> values;
    const char* p = text.c_str();
    while (*p) {
        while (*p == ',' || *p == ' ' || *p == '\t' || *p == '\r' || *p == '\n')
            ++p;
        if (!*p)
            break;
        char* end = nullptr;
        long value = strtol(p, &end, 10);
        if (end == p) {
            ++p;  // not a number: skip the character
            continue;
        }
        values.push_back(static_cast<int>(value));
        p = end;
    }
    return values;
}

uint32_t ToAnimType(const std::string& text)
{
    static const std::pair<const char*, uint32_t> names[] = {
        {"none", TextureDesc::AnimNone},
        {"once", TextureDesc::AnimOnce},
        {"loop", TextureDesc::AnimLoop},
        {"pingpong", TextureDesc::AnimPingPong},
        {"backward loop", TextureDesc::AnimBackwardLoop},
        {"backward_loop", TextureDesc::AnimBackwardLoop},
        {"backward pingpong", TextureDesc::AnimBackwardPingPong},
        {"backward_pingpong", TextureDesc::AnimBackwardPingPong},
    };
    for (const auto& [name, value] : names)
        if (strcasecmp(text.c_str(), name) == 0)
            return value;
    const int number = ToInt(text);
    return number >= 0 && number <= 5 ? static_cast<uint32_t>(number) : 0;
}

const std::string* Attribute(const Conversion& c, const char* name)
{
    auto it = c.attributes.find(name);
    return it == c.attributes.end() ? nullptr : &it->second;
}

void OnAttribute(void* user, misc::XmlRecord*, int, const char* name, size_t nameLength, const char* value,
                 size_t valueLength, bool)
{
    auto& c = *static_cast<Conversion*>(user);
    if (valueLength >= 1024) {
        OX_LOG(kChannel, diag::LogError, "%s: the value of \"%.*s\" is longer than 1023 bytes; ignored", c.name,
               static_cast<int>(nameLength), name);
        return;
    }
    // Texts of the records end at their first zero byte.
    c.attributes[std::string(name, strnlen(name, nameLength))] = std::string(value, strnlen(value, valueLength));
}

void OnStart(void* user, misc::XmlRecord*, int) { static_cast<Conversion*>(user)->attributes.clear(); }

void OnAttributesDone(void* user, misc::XmlRecord* stack, int depth)
{
    auto& c = *static_cast<Conversion*>(user);
    const std::string_view element = ElementName(stack, depth);
    stack[depth].userWord2 = 0;
    if (element == "surface") {
        if (c.surfacesClosed) {
            OX_LOG(kChannel, diag::LogError, "%s: surfaces must come before the first group; \"%s\" ignored",
                   c.name, Attribute(c, "path") ? Attribute(c, "path")->c_str() : "");
            return;
        }
        const std::string* path = Attribute(c, "path");
        if (!path || path->empty() || path->size() >= misc::StringA120::kCapacity) {
            OX_LOG(kChannel, diag::LogError, "%s: a surface without a usable path is ignored", c.name);
            return;
        }
        Loader::SurfaceRecord record {};
        SetString(record.path, *path);
        if (const std::string* w = Attribute(c, "width"))
            record.width = static_cast<uint16_t>(std::clamp(ToInt(*w), 0, 0xFFFF));
        if (const std::string* h = Attribute(c, "height"))
            record.height = static_cast<uint16_t>(std::clamp(ToInt(*h), 0, 0xFFFF));
        record.internal_format = graphics::FormatA8R8G8B8;
        if (IsContainerPath(path->c_str())) {
            uint32_t w = 0, h = 0;
            unsigned format = 0;
            if (c.pack && ReadImageDimensions(*c.pack, path->c_str(), w, h, format))
                record.internal_format = static_cast<uint16_t>(format);
        }
        record.flags = path->find("!nearest") != std::string::npos ? graphics::CSurface::FlagNearest : 0;
        c.surfaces.push_back(record);
    } else if (element == "group") {
        c.CloseSurfaces();
        Loader::GroupRecord record {};
        const std::string* id = Attribute(c, "id");
        SetString(record.id, id ? *id : std::string());
        const std::string* flags = Attribute(c, "flags");
        record.flags = flags && flags->find("load_on_demand") != std::string::npos ? Loader::GroupLoadOnDemand : 0;
        record.parent = c.groupStack.empty() ? 0 : c.groupStack.back();
        const uint32_t offset =
            c.GroupsBegin() + static_cast<uint32_t>(c.groups.size() * sizeof(Loader::GroupRecord));
        c.groups.push_back(record);
        c.groupStack.push_back(offset);
        stack[depth].userWord2 = 1;  // closes a group at its end
    } else if (element == "image") {
        c.CloseSurfaces();
        c.inImage = false;
        const std::string* id = Attribute(c, "id");
        if (c.groupStack.empty()) {
            OX_LOG(kChannel, diag::LogError, "%s: image \"%s\" is outside any group; ignored", c.name,
                   id ? id->c_str() : "");
            return;
        }
        if (!id || id->empty() || id->size() >= misc::StringA88::kCapacity) {
            OX_LOG(kChannel, diag::LogError, "%s: an image without a usable id is ignored", c.name);
            return;
        }
        PendingImage image;
        image.id = *id;
        if (const std::string* path = Attribute(c, "path"))
            image.path = *path;
        if (const std::string* type = Attribute(c, "anim_type"))
            image.animType = ToAnimType(*type);
        if (const std::string* cols = Attribute(c, "cols")) {
            image.cols = ToInt(*cols);
            image.hasCols = true;
        }
        if (const std::string* rows = Attribute(c, "rows")) {
            image.rows = ToInt(*rows);
            image.hasRows = true;
        }
        if (const std::string* map = Attribute(c, "frame_map")) {
            image.frameMap = ToIntList(*map);
            image.hasFrameMap = true;
        }
        if (const std::string* delays = Attribute(c, "frame_delay"))
            image.delays = ToIntList(*delays);
        image.group = c.groupStack.back();
        image.groupFlags = c.groups[(image.group - c.GroupsBegin()) / sizeof(Loader::GroupRecord)].flags;
        c.image = std::move(image);
        c.inImage = true;
    } else if (element == "part") {
        if (!c.inImage)
            return;
        if (c.image.parts.size() >= Loader::MaximumParts) {
            OX_LOG(kChannel, diag::LogError, "%s: image \"%s\" has more than %zu parts; the rest are ignored",
                   c.name, c.image.id.c_str(), Loader::MaximumParts);
            return;
        }
        PartRect part;
        if (const std::string* v = Attribute(c, "rect_x")) part.x = ToInt(*v);
        if (const std::string* v = Attribute(c, "rect_y")) part.y = ToInt(*v);
        if (const std::string* v = Attribute(c, "rect_w")) part.w = ToInt(*v);
        if (const std::string* v = Attribute(c, "rect_h")) part.h = ToInt(*v);
        c.image.parts.push_back(part);
    }
}

// The frame map of n frames for an animation type. Two frames or fewer run forward
// whatever the type.
std::vector<int> DefaultFrameMap(uint32_t type, int n)
{
    std::vector<int> map;
    if (type == TextureDesc::AnimBackwardLoop && n > 2) {
        for (int i = n - 1; i >= 0; --i)
            map.push_back(i);
    } else if (type == TextureDesc::AnimPingPong && n > 2) {
        for (int i = 0; i < n; ++i)
            map.push_back(i);
        for (int i = n - 2; i >= 1; --i)
            map.push_back(i);
    } else if (type == TextureDesc::AnimBackwardPingPong && n > 2) {
        for (int i = n - 1; i >= 0; --i)
            map.push_back(i);
        for (int i = 1; i <= n - 2; ++i)
            map.push_back(i);
    } else {
        for (int i = 0; i < n; ++i)
            map.push_back(i);
    }
    return map;
}

void FinishImage(Conversion& c)
{
    PendingImage& image = c.image;
    const int surfaceIndex = c.FindSurface(image.path);
    if (surfaceIndex < 0) {
        OX_LOG(kChannel, diag::LogError, "%s: image \"%s\" names the undeclared surface \"%s\"; ignored", c.name,
               image.id.c_str(), image.path.c_str());
        return;
    }
    Loader::SurfaceRecord& surface = c.surfaces[surfaceIndex];
    const bool validParts = !image.parts.empty() && image.parts[0].w != 0 && image.parts[0].h != 0;

    std::vector<UVRect> parts;
    int frameWidth = 0, frameHeight = 0;
    if (validParts) {
        if (!(surface.width && surface.height)) {
            OX_LOG(kChannel, diag::LogError,
                   "%s: image \"%s\" has parts but surface \"%s\" has no width and height; ignored", c.name,
                   image.id.c_str(), image.path.c_str());
            return;
        }
        const float w = surface.width, h = surface.height;
        // The far edges are summed as floats: a part's numbers may be anything an int holds.
        for (const PartRect& p : image.parts)
            parts.push_back({p.x / w, p.y / h, (float(p.x) + float(p.w)) / w, (float(p.y) + float(p.h)) / h});
        frameWidth = image.parts[0].w;
        frameHeight = image.parts[0].h;
    } else {
        uint32_t w = 0, h = 0;
        unsigned format = graphics::FormatA8R8G8B8;
        if (c.pack && ReadImageDimensions(*c.pack, image.path.c_str(), w, h, format) && w <= 0xFFFF && h <= 0xFFFF) {
            surface.width = static_cast<uint16_t>(w);
            surface.height = static_cast<uint16_t>(h);
            surface.internal_format = static_cast<uint16_t>(format);
            surface.flags = image.path.find("!nearest") != std::string::npos ? graphics::CSurface::FlagNearest : 0;
        } else {
            OX_LOG(kChannel, diag::LogError, "Cannot load surface dimensions: \"%s\"", image.path.c_str());
            OX_LOG(kChannel, diag::LogError, "%s: image \"%s\" has no image file \"%s\"", c.name, image.id.c_str(),
                   image.path.c_str());
        }
        if (!image.hasCols || !image.hasRows || image.cols < 1 || image.rows < 1) {
            OX_LOG(kChannel, diag::LogWarning, "%s: image \"%s\" without parts needs cols and rows of 1 or more",
                   c.name, image.id.c_str());
            image.cols = std::max(image.cols, 1);
            image.rows = std::max(image.rows, 1);
        }
        frameWidth = surface.width / image.cols;
        frameHeight = surface.height / image.rows;
    }

    if (image.cols > 255 || image.rows > 255 || int64_t(image.cols) * image.rows > int64_t(Loader::MaximumParts)) {
        OX_LOG(kChannel, diag::LogError, "%s: image \"%s\" has %d x %d frames, more than %zu; ignored", c.name,
               image.id.c_str(), image.cols, image.rows, Loader::MaximumParts);
        return;
    }
    std::vector<int> delays;
    std::vector<int> map;
    const int cells = image.cols * image.rows;
    if (cells >= 2 && image.animType != TextureDesc::AnimNone) {
        int frames = cells;
        if (validParts && frames != static_cast<int>(parts.size())) {
            OX_LOG(kChannel, diag::LogError, "%s: image \"%s\" has %d frames but %zu parts; ignored", c.name,
                   image.id.c_str(), frames, parts.size());
            return;
        }
        if (!validParts) {
            const float w = surface.width ? surface.width : 1.0f, h = surface.height ? surface.height : 1.0f;
            for (int row = 0; row < image.rows; ++row)
                for (int col = 0; col < image.cols; ++col)
                    parts.push_back({col * frameWidth / w, row * frameHeight / h, (col + 1) * frameWidth / w,
                                     (row + 1) * frameHeight / h});
        }
        if (frames > static_cast<int>(TextureDesc::MaximumFrames)) {
            OX_LOG(kChannel, diag::LogError, "%s: image \"%s\" has %d frames; only the first 32 animate", c.name,
                   image.id.c_str(), frames);
            frames = TextureDesc::MaximumFrames;
        }
        for (int i = 0; i < frames; ++i) {
            if (i < static_cast<int>(image.delays.size()))
                delays.push_back(image.delays[i]);
            else
                delays.push_back(delays.empty() ? 0 : delays.back());
        }
        if (image.hasFrameMap) {
            for (int frame : image.frameMap) {
                if (map.size() >= TextureDesc::MaximumFrames)
                    break;
                if (frame < 0 || frame >= frames) {
                    OX_LOG(kChannel, diag::LogError, "%s: image \"%s\": frame %d of the frame map does not exist",
                           c.name, image.id.c_str(), frame);
                    continue;
                }
                map.push_back(frame);
            }
        } else {
            map = DefaultFrameMap(image.animType, frames);
        }
        if (map.size() > TextureDesc::MaximumFrames) {
            OX_LOG(kChannel, diag::LogError, "%s: image \"%s\": the frame map is cut to 32 entries", c.name,
                   image.id.c_str());
            map.resize(TextureDesc::MaximumFrames);
        }
    } else {
        delays = {0};
        map = {0};
        if (!validParts)
            parts = {{0, 0, 1, 1}};
    }

    std::vector<uint8_t> bytes(sizeof(TextureDesc) + parts.size() * sizeof(UVRect), 0);
    auto* desc = new (bytes.data()) TextureDesc();
    SetString(desc->id, image.id);
    desc->anim_type = image.animType;
    desc->flags = image.groupFlags | TextureDesc::FlagStatic;
    desc->frame_width = static_cast<uint16_t>(std::clamp(frameWidth, 0, 0xFFFF));
    desc->frame_height = static_cast<uint16_t>(std::clamp(frameHeight, 0, 0xFFFF));
    memset(desc->frame_delays, 0xFF, sizeof desc->frame_delays);
    memset(desc->frame_map, 0xFF, sizeof desc->frame_map);
    for (size_t i = 0; i < delays.size(); ++i)
        desc->frame_delays[i] = static_cast<uint16_t>(std::clamp(delays[i], 0, 0xFFFE));
    unsigned total = 0;
    for (size_t i = 0; i < map.size(); ++i) {
        desc->frame_map[i] = static_cast<int8_t>(map[i]);
        total += desc->frame_delays[map[i]];
    }
    desc->group = image.group;
    desc->surface = c.SurfaceOffset(surfaceIndex);
    desc->cols = static_cast<uint8_t>(std::clamp(image.cols, 0, 255));
    desc->rows = static_cast<uint8_t>(std::clamp(image.rows, 0, 255));
    desc->frame_delays_count = static_cast<uint8_t>(delays.size());
    desc->frame_map_length = static_cast<uint8_t>(map.size());
    desc->total_time = static_cast<uint16_t>(std::min(total, 0xFFFFu));
    desc->parts_amount = static_cast<uint16_t>(parts.size());
    memcpy(bytes.data() + sizeof(TextureDesc), parts.data(), parts.size() * sizeof(UVRect));

    if (c.images.count(image.id))
        OX_LOG(kChannel, diag::LogWarning, "%s: image \"%s\" is declared twice; the last one holds", c.name,
               image.id.c_str());
    c.images[image.id] = std::move(bytes);
    c.imageGroups[image.id] = image.group;
}

void OnEnd(void* user, misc::XmlRecord* stack, int depth)
{
    auto& c = *static_cast<Conversion*>(user);
    const std::string_view element = ElementName(stack, depth);
    if (element == "surfaces") {
        c.CloseSurfaces();
    } else if (element == "group") {
        if (stack[depth].userWord2 == 1 && !c.groupStack.empty())
            c.groupStack.pop_back();
    } else if (element == "image") {
        if (c.inImage)
            FinishImage(c);
        c.inImage = false;
    }
}

template <class T>
void Put(std::vector<uint8_t>& out, size_t at, const T& value)
{
    memcpy(out.data() + at, &value, sizeof(T));
}

} // namespace

bool IsContainerPath(const char* path)
{
    return path && (EndsWith(path, ".pvr") || EndsWith(path, ".pvrlzo"));
}

bool ReadImageDimensions(misc::CGamePack& pack, const char* path, uint32_t& width, uint32_t& height,
                         unsigned& internal_format)
{
    if (!path || !*path)
        return false;
    if (IsContainerPath(path))
        return misc::imagelib::PvrGetInfo(path, width, height, internal_format, &pack);
    std::unique_ptr<misc::imagelib::CImageDecoder> decoder = misc::imagelib::MakeDecoder(path);
    unsigned size = 0;
    const void* data = decoder ? pack.Open(path, &size) : nullptr;
    if (!data)
        return false;
    decoder->SetName(path);
    const bool ok = decoder->GetInfo(data, size, width, height);
    internal_format = graphics::FormatA8R8G8B8;
    pack.Close(data);
    return ok;
}

bool CTextureDeclarationsLoader::ConvertXml(const char* xml, size_t size, const char* name,
                                            std::vector<uint8_t>& bulk) const
{
    bulk.clear();
    Conversion c;
    c.pack = &Pack();
    c.name = name;
    misc::XmlParseProblem problem;
    const bool parsed = misc::ParseXml(xml, size, &c, OnStart, OnAttribute, OnAttributesDone, OnEnd, nullptr, &problem);
    if (!parsed || !problem.what.empty()) {
        OX_LOG(kChannel, diag::LogError, "Cannot read texture declarations \"%s\": line %u: %s", name, problem.line,
               problem.what.empty() ? "not an XML file" : problem.what.c_str());
        return false;
    }
    c.CloseSurfaces();

    size_t total = sizeof(Header) + c.surfaces.size() * sizeof(SurfaceRecord) +
                   c.groups.size() * sizeof(GroupRecord) + c.images.size() * sizeof(ImageEntry);
    for (const auto& [id, bytes] : c.images)
        total += bytes.size();
    if (total > ConversionBufferSize) {
        OX_LOG(kChannel, diag::LogError, "Texture declarations \"%s\" need %zu bytes, more than the %zu allowed", name,
               total, ConversionBufferSize);
        return false;
    }
    bulk.assign(total, 0);
    Header header {Magic, static_cast<uint32_t>(c.surfaces.size()), static_cast<uint32_t>(c.groups.size()),
                   static_cast<uint32_t>(c.images.size())};
    Put(bulk, 0, header);
    size_t at = sizeof(Header);
    for (const SurfaceRecord& s : c.surfaces) {
        Put(bulk, at, s);
        at += sizeof(SurfaceRecord);
    }
    for (const GroupRecord& g : c.groups) {
        Put(bulk, at, g);
        at += sizeof(GroupRecord);
    }
    // The table in id order (the map's), each description behind the table.
    size_t descAt = at + c.images.size() * sizeof(ImageEntry);
    for (const auto& [id, bytes] : c.images) {
        ImageEntry entry {};
        SetString(entry.id, id);
        entry.desc = static_cast<uint32_t>(descAt);
        entry.group = c.imageGroups[id];
        Put(bulk, at, entry);
        at += sizeof(ImageEntry);
        memcpy(bulk.data() + descAt, bytes.data(), bytes.size());
        descAt += bytes.size();
    }
    return true;
}

bool CTextureDeclarationsLoader::LoadXml(const char* xml, size_t size, const char* name)
{
    Release();
    std::vector<uint8_t> bulk;
    if (!ConvertXml(xml, size, name, bulk))
        return false;
    m_Owned.assign((bulk.size() + 3) / 4, 0);
    memcpy(m_Owned.data(), bulk.data(), bulk.size());
    m_Data = reinterpret_cast<const Header*>(m_Owned.data());
    m_Size = bulk.size();
    return true;
}

} // namespace ox::core

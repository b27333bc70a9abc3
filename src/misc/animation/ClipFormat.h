#pragma once
// The records of the clip bulk: properties/clips.bindump as a file, and the same bytes in
// memory when the bulk is built from XML. Every record is read in place; everything is
// 4-byte aligned and variable parts are sized by explicit counts.
//
//   header | table of entries sorted by id | clip records
//   clip record: ClipRecord | objects ... | u32 0 (the end mark)
//   object: ClipObjectBase | extension of its type | key states | sound points
#include "graphics/Color.h"
#include "misc/Poly.h"
#include "misc/Rect.h"
#include "misc/String.h"
#include "misc/Vector.h"

#include <cstddef>
#include <cstdint>

namespace ox::misc::anim {

// "CLP" and the format revision 1 in the top byte.
constexpr uint32_t kClipsMagic = 0x01504C43;
constexpr uint32_t kClipsRevision = 1;
// A clip record, its end mark included, is smaller than this.
constexpr uint32_t kMaxClipSize = 0x20000;
// Counts stored in one byte.
constexpr unsigned kMaxRecordCount = 255;

enum ClipObjectType : uint32_t {
    UnknownType = 0,
    PathType = 1,
    ImageType = 2,
    ParticleType = 3,
    ClipType = 4,
    TextType = 5,
};

struct ClipsHeader {
    uint32_t magic;
    uint32_t count;
};

struct ClipTableEntry {
    StringA88 id;
    uint32_t offset;  // of the clip record from the start of the bulk; a multiple of 4
};

struct ClipRecord {
    uint32_t size;  // of the record, the end mark included
    StringA88 id;
    float x, y, w, h;
};

// One key of an object's time line.
struct KeyState {
    int32_t t;  // milliseconds
    FloatVector pos;
    float k;  // coefficient along the followed path
    Poly4 contour;
    float angle;  // radians
    graphics::Color color;
    uint32_t flip;
    uint32_t custom;
    uint8_t itpl;  // interpolate toward the next key
    uint8_t unused[3];
};

// A sound started when the key of time `k` is reached.
struct SoundPoint {
    int32_t k;
    StringA88 id;
};

// A point of a path: the outgoing and incoming Bezier controls and the anchor, relative to
// the path's contour.
struct PathPoint {
    FloatVector p1, p2, a;
};

struct ClipObjectBase {
    uint32_t size;  // of the object with its extension, keys and sounds; a multiple of 4
    uint32_t type;  // ClipObjectType
    StringA88 id;
    FloatVector pos;
    Poly4 contour;
    float angle;
    graphics::Color color;
    uint32_t flip;
    uint32_t user_flags;
    uint32_t anim_type;
    uint32_t anim_dir;
    StringA88 path;  // id of the path object this one follows
    uint8_t snap;
    uint8_t additive;
    uint8_t visible;
    uint8_t keypointsnum;
    uint8_t soundpointsnum;
    uint8_t unused[3];

    // The bytes of the type's extension, 0 for an unknown type.
    uint32_t ExtensionSize() const;
    const void* Extension() const { return this + 1; }
    const KeyState* KeyStates() const
    {
        return reinterpret_cast<const KeyState*>(reinterpret_cast<const uint8_t*>(this + 1) + ExtensionSize());
    }
    const SoundPoint* SoundPoints() const { return reinterpret_cast<const SoundPoint*>(KeyStates() + keypointsnum); }
    // The bytes the counts ask for: base, extension, keys and sounds.
    uint32_t NeededSize() const
    {
        return static_cast<uint32_t>(sizeof(ClipObjectBase) + ExtensionSize() + keypointsnum * sizeof(KeyState) +
                                     soundpointsnum * sizeof(SoundPoint));
    }
};

struct PathExtension {
    uint8_t closed;
    uint8_t points;
    uint8_t unused[2];
    const PathPoint* Points() const { return reinterpret_cast<const PathPoint*>(this + 1); }
};

struct ImageExtension {
    StringA88 image;
};

struct ClipViewExtension {
    StringA88 clip;
};

struct ParticleExtension {
    StringA88 system;
    int32_t adv_time;
    uint8_t fix_emit;
    uint8_t scale;
    uint8_t unused[2];
};

// Left, right, top, bottom.
struct Insets {
    float left, right, top, bottom;
};

struct TextExtension {
    StringA88 font;
    uint32_t tx_fl;
    FloatRect bounds;
    StringA88 background;
    graphics::Color bk_color;
    Insets insets;
    StringA56 key;  // string-table key, UTF-8
};

// The extension size of a known type with no variable part (a path adds its points).
constexpr uint32_t kExtensionBaseSize[] = {0, sizeof(PathExtension), sizeof(ImageExtension), sizeof(ParticleExtension),
                                           sizeof(ClipViewExtension), sizeof(TextExtension)};

inline uint32_t ClipObjectBase::ExtensionSize() const
{
    if (type == PathType)
        return static_cast<uint32_t>(sizeof(PathExtension) +
                                     static_cast<const PathExtension*>(Extension())->points * sizeof(PathPoint));
    return type < std::size(kExtensionBaseSize) ? kExtensionBaseSize[type] : 0;
}

// The objects of a checked clip record in order: the first at the end of the record's
// header, each next one `size` bytes on, a size of 0 ends the list.
inline const ClipObjectBase* FirstObject(const ClipRecord* clip)
{
    return reinterpret_cast<const ClipObjectBase*>(clip + 1);
}
inline const ClipObjectBase* NextObject(const ClipObjectBase* object)
{
    const auto* next = reinterpret_cast<const ClipObjectBase*>(reinterpret_cast<const uint8_t*>(object) + object->size);
    return next->size ? next : nullptr;
}
inline const ClipObjectBase* ObjectsBegin(const ClipRecord* clip)
{
    const ClipObjectBase* first = FirstObject(clip);
    return first->size ? first : nullptr;
}

static_assert(sizeof(ClipsHeader) == 8);
static_assert(sizeof(ClipTableEntry) == 100);
static_assert(sizeof(ClipRecord) == 116);
static_assert(sizeof(KeyState) == 72);
static_assert(sizeof(SoundPoint) == 100);
static_assert(sizeof(PathPoint) == 24);
static_assert(sizeof(ClipObjectBase) == 276);
static_assert(sizeof(PathExtension) == 4);
static_assert(sizeof(ImageExtension) == 96 && sizeof(ClipViewExtension) == 96);
static_assert(sizeof(ParticleExtension) == 104);
static_assert(sizeof(TextExtension) == 300);
static_assert(alignof(ClipRecord) == 4 && alignof(ClipObjectBase) == 4 && alignof(KeyState) == 4);
#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Winvalid-offsetof"
static_assert(offsetof(ClipTableEntry, offset) == 96);
static_assert(offsetof(ClipRecord, id) == 4 && offsetof(ClipRecord, x) == 100 && offsetof(ClipRecord, h) == 112);
static_assert(offsetof(KeyState, pos) == 4 && offsetof(KeyState, k) == 12 && offsetof(KeyState, contour) == 16 &&
              offsetof(KeyState, angle) == 48 && offsetof(KeyState, color) == 52 && offsetof(KeyState, flip) == 60 &&
              offsetof(KeyState, custom) == 64 && offsetof(KeyState, itpl) == 68);
static_assert(offsetof(SoundPoint, id) == 4);
static_assert(offsetof(PathPoint, p2) == 8 && offsetof(PathPoint, a) == 16);
static_assert(offsetof(ClipObjectBase, type) == 4 && offsetof(ClipObjectBase, id) == 8 &&
              offsetof(ClipObjectBase, pos) == 104 && offsetof(ClipObjectBase, contour) == 112 &&
              offsetof(ClipObjectBase, angle) == 144 && offsetof(ClipObjectBase, color) == 148 &&
              offsetof(ClipObjectBase, flip) == 156 && offsetof(ClipObjectBase, user_flags) == 160 &&
              offsetof(ClipObjectBase, anim_type) == 164 && offsetof(ClipObjectBase, anim_dir) == 168 &&
              offsetof(ClipObjectBase, path) == 172 && offsetof(ClipObjectBase, snap) == 268 &&
              offsetof(ClipObjectBase, additive) == 269 && offsetof(ClipObjectBase, visible) == 270 &&
              offsetof(ClipObjectBase, keypointsnum) == 271 && offsetof(ClipObjectBase, soundpointsnum) == 272);
static_assert(offsetof(ParticleExtension, adv_time) == 96 && offsetof(ParticleExtension, fix_emit) == 100 &&
              offsetof(ParticleExtension, scale) == 101);
static_assert(offsetof(TextExtension, tx_fl) == 96 && offsetof(TextExtension, bounds) == 100 &&
              offsetof(TextExtension, background) == 116 && offsetof(TextExtension, bk_color) == 212 &&
              offsetof(TextExtension, insets) == 220 && offsetof(TextExtension, key) == 236);
#pragma GCC diagnostic pop

} // namespace ox::misc::anim

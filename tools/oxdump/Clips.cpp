#include "oxdump/Clips.h"

#include "misc/animation/ClipObject.h"
#include "misc/animation/ClipsLoader.h"
#include "misc/sys/Path.h"

#include <strings.h>

#include <algorithm>
#include <cstdio>
#include <filesystem>
#include <string>
#include <vector>

namespace fs = std::filesystem;
using namespace ox::misc::anim;

namespace oxdump {

const char* const kClipsHelp =
    "usage: oxdump clips <clips.xml|folder> <out>\n"
    "\n"
    "Compiles clips into properties/clips.bindump, the block the game uses in place: the\n"
    "table of clips sorted by id and one record per clip with its objects, their key states\n"
    "and sound points. The input is one XML file holding <Clip> elements (the game's\n"
    "properties/clips.xml), or a folder whose every .xml file but groups.xml holds clips\n"
    "(the game's clips/ folder). What cannot be used is reported with its clip and left out.\n";

namespace {

// The XML files of a clips folder, by name.
std::vector<std::string> ClipFiles(const std::string& folder)
{
    std::vector<std::string> files;
    std::error_code error;
    for (const auto& entry : fs::directory_iterator(folder, error)) {
        const std::string name = entry.path().filename().string();
        if (entry.is_regular_file() && name.size() > 4 && strcasecmp(name.c_str() + name.size() - 4, ".xml") == 0 &&
            strcasecmp(name.c_str(), "groups.xml") != 0)
            files.push_back(entry.path().string());
    }
    std::sort(files.begin(), files.end());
    return files;
}

const char* const kAnimationTypes[] = {"once", "loop", "pingpong"};

const char* AnimationTypeName(uint32_t type) { return type < 3 ? kAnimationTypes[type] : "?"; }

void PrintPoly(const ox::misc::Poly4& p)
{
    printf("contour %g,%g %g,%g %g,%g %g,%g", p[0].X, p[0].Y, p[1].X, p[1].Y, p[2].X, p[2].Y, p[3].X, p[3].Y);
}

void ShowExtension(const ClipObjectBase& object)
{
    switch (object.type) {
    case ImageType:
        printf(" texture %s", static_cast<const ImageExtension*>(object.Extension())->image.c_str());
        break;
    case ClipType:
        printf(" clip %s", static_cast<const ClipViewExtension*>(object.Extension())->clip.c_str());
        break;
    case ParticleType: {
        const auto* e = static_cast<const ParticleExtension*>(object.Extension());
        printf(" system %s advance %dms%s%s", e->system.c_str(), e->adv_time, e->fix_emit ? " fix_emit" : "",
               e->scale ? " scale" : "");
        break;
    }
    case TextType: {
        const auto* e = static_cast<const TextExtension*>(object.Extension());
        printf(" font %s flags 0x%X bounds %g,%g %gx%g background %s colour 0x%08X text \"%s\"", e->font.c_str(),
               e->tx_fl, e->bounds.X, e->bounds.Y, e->bounds.Width, e->bounds.Height, e->background.c_str(),
               e->bk_color.GetARGB(), e->key.c_str());
        break;
    }
    case PathType: {
        const auto* e = static_cast<const PathExtension*>(object.Extension());
        printf(" %s, %u points", e->closed ? "closed" : "open", e->points);
        break;
    }
    default:
        break;
    }
}

void ShowObject(const ClipObjectBase& object)
{
    printf("  %s %s at %g,%g angle %g colour 0x%08X flip %u user %u %s %s%s%s%s", CClipObject::GetTypeName(object.type),
           object.id.c_str(), object.pos.X, object.pos.Y, object.angle, object.color.GetARGB(), object.flip,
           object.user_flags, AnimationTypeName(object.anim_type), object.anim_dir ? "backward" : "forward",
           object.visible ? "" : " hidden", object.additive ? " additive" : "", object.snap ? " snap" : "");
    if (!object.path.empty())
        printf(" path %s", object.path.c_str());
    ShowExtension(object);
    printf("\n    ");
    PrintPoly(object.contour);
    printf("\n");
    if (object.type == PathType) {
        const auto* e = static_cast<const PathExtension*>(object.Extension());
        for (unsigned i = 0; i < e->points; ++i) {
            const PathPoint& p = e->Points()[i];
            printf("    point %g,%g controls %g,%g %g,%g\n", p.a.X, p.a.Y, p.p1.X, p.p1.Y, p.p2.X, p.p2.Y);
        }
    }
    for (unsigned i = 0; i < object.keypointsnum; ++i) {
        const KeyState& k = object.KeyStates()[i];
        printf("    key %d at %g,%g k %g angle %g colour 0x%08X flip %u custom %u%s\n      ", k.t, k.pos.X, k.pos.Y, k.k,
               k.angle, k.color.GetARGB(), k.flip, k.custom, k.itpl ? " interpolated" : "");
        PrintPoly(k.contour);
        printf("\n");
    }
    for (unsigned i = 0; i < object.soundpointsnum; ++i)
        printf("    sound %d %s\n", object.SoundPoints()[i].k, object.SoundPoints()[i].id.c_str());
}

} // namespace

int Clips(int argc, char** argv)
{
    if (argc != 4) {
        fprintf(stderr, "oxdump: clips needs <clips.xml|folder> <out>\n%s", kClipsHelp);
        return 2;
    }
    const std::string input = argv[2], output = argv[3];
    std::error_code error;
    const std::vector<std::string> files = fs::is_directory(input, error) ? ClipFiles(input) : std::vector {input};
    ClipRecords clips;
    for (const std::string& file : files) {
        std::string xml;
        if (!ox::misc::sys::ReadWholeFile(file, xml)) {
            fprintf(stderr, "oxdump: cannot read %s\n", file.c_str());
            return 1;
        }
        if (!ConvertClipsXml(xml.data(), xml.size(), file.c_str(), clips)) {
            fprintf(stderr, "oxdump: %s is not valid\n", file.c_str());
            return 1;
        }
    }
    CClipsLoader loader;
    if (!loader.LoadRecords(clips)) {
        fprintf(stderr, "oxdump: the clips of %s are not valid\n", input.c_str());
        return 1;
    }
    if (!ox::misc::sys::WriteFileAtomically(output, loader.Data(), loader.DataSize())) {
        fprintf(stderr, "oxdump: cannot write %s\n", output.c_str());
        return 1;
    }
    printf("%s: %u clips, %zu bytes\n", output.c_str(), loader.Count(), loader.DataSize());
    return 0;
}

bool ShowClips(const uint8_t* data, size_t size, const char* name)
{
    CClipsLoader loader;
    if (!loader.LoadFromMemory(data, size, name))
        return false;
    printf("clips, revision %u: %u clips\n", kClipsRevision, loader.Count());
    for (uint32_t i = 0; i < loader.Count(); ++i) {
        const ClipTableEntry& entry = loader.Table()[i];
        const ClipRecord* clip = loader.FindClip(entry.id.c_str());
        if (!clip) {
            printf("clip %s: left out, broken\n", entry.id.c_str());
            continue;
        }
        printf("clip %s at %g,%g size %gx%g, %u bytes\n", clip->id.c_str(), clip->x, clip->y, clip->w, clip->h,
               clip->size);
        for (const ClipObjectBase* object = ObjectsBegin(clip); object; object = NextObject(object))
            ShowObject(*object);
    }
    return true;
}

} // namespace oxdump

// oxdump: compiles game data into the binary forms the game reads in place, and shows
// what a binary dump holds.
#include "core/ParticlesLoader.h"
#include "core/TextureDeclarations.h"
#include "core/TexturesAlpha.h"
#include "core/TexturesAlphaWriter.h"
#include "common/LogToStderr.h"
#include "misc/animation/ClipFormat.h"
#include "oxdump/Clips.h"
#include "oxdump/Particles.h"
#include "oxdump/Quest.h"
#include "quest/QuestData.h"
#include "diag/Log.h"
#include "misc/sys/Path.h"
#include "misc/GamePack.h"
#include "misc/StringTable.h"
#include "misc/Unicode.h"
#include "sound/SoundDeclarations.h"

#include <algorithm>
#include <cstdio>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <string>
#include <unistd.h>
#include <vector>

namespace fs = std::filesystem;
using ox::misc::CStringTable;

namespace {

const char* kUsage =
    "usage: oxdump strings <strings.xml> <out> [--utf32]    compile the string table\n"
    "       oxdump resources <resources.xml> <out> [--root DIR]\n"
    "                                                    compile the texture declarations\n"
    "       oxdump texturesalpha <folder|list> <out> [--order auto|rows|columns]\n"
    "                                                    build the alpha-mask table\n"
    "       oxdump clips <clips.xml|folder> <out>        compile the clips\n"
    "       oxdump particles <particle.xml|folder> <out> compile the particle systems\n"
    "       oxdump quest <quest.xml> <quest.bindump>    compile the quest\n"
    "       oxdump sounds <sounds.xml> <out>             compile the sound declarations\n"
    "       oxdump show <file.bindump>                   print the records of a dump\n"
    "       oxdump COMMAND --help                        details of one command\n";

const char* kStringsHelp =
    "usage: oxdump strings <strings.xml> <out> [--utf32]\n"
    "\n"
    "Reads elements with an id attribute and a UTF-8 text, e.g.\n"
    "  <strings><s id=\"12\">Open the door</s></strings>\n"
    "and writes the 16-bit table the game reads in place. Name the output\n"
    "properties/strings.bindump (or properties/strings.xml.bin_utf16le); with --utf32\n"
    "it writes the 32-bit form instead.\n";

const char* kResourcesHelp =
    "usage: oxdump resources <resources.xml> <out> [--root DIR]\n"
    "\n"
    "Compiles the texture declarations into properties/resources.bindump, the block the\n"
    "game uses in place: surfaces sorted by path, groups, the image table sorted by id\n"
    "and one description per image. Image sizes the XML leaves out are read from the\n"
    "image files, found under the game folder DIR (by default the folder that holds\n"
    "properties/, or else the XML's own folder), inside its game.pack or loose.\n";

const char* kTexturesAlphaHelp =
    "usage: oxdump texturesalpha <folder|list> <out> [--order auto|rows|columns]\n"
    "\n"
    "Builds properties/texturesalpha.bindump, one run-length mask per image (a pixel is\n"
    "solid when its alpha is not 0), for the ids the game asks with. From a folder: every\n"
    ".png and .jpg in it and below, the id being the file name without extension. From a\n"
    "list file: one image per line, \"ID=PATH\" or \"PATH\" (id as above), paths relative to\n"
    "the list; empty lines and lines starting with # are skipped. --order picks the scan\n"
    "order; auto (default) takes whichever gives fewer runs.\n";

const char* kSoundsHelp =
    "usage: oxdump sounds <sounds.xml> <out>\n"
    "\n"
    "Compiles the sound declarations into properties/sounds.bindump: one 352-byte record\n"
    "per <sound> (id, file, group_template, balance, volume, priority, repeat,\n"
    "max_concurrent_sound_play, concurrent_sound_play_delay, speed), in the order of the\n"
    "document, each with the load_on_demand flag of its innermost <sound_group>. Paths\n"
    "become lower case with forward slashes. Problems of single sounds are shown; the\n"
    "files the sounds name are not checked (the game leaves out a sound whose file is\n"
    "missing, and says so).\n";

const char* kShowHelp =
    "usage: oxdump show <file.bindump>\n"
    "\n"
    "Checks a binary dump as the game would and prints its records: texture declarations\n"
    "(resources.bindump), alpha masks (texturesalpha.bindump), clips (clips.bindump), particle\n"
    "systems (particles.bindump), sound\n"
    "declarations (sounds.bindump), quests (quest.bindump) and string tables (strings.bindump,\n"
    "strings.xml.bin_utf16le, strings.xml.bin_utf32le).\n";

int UsageError(const std::string& message, const char* usage = kUsage)
{
    fprintf(stderr, "oxdump: %s\n%s", message.c_str(), usage);
    return 2;
}

int Strings(int argc, char** argv)
{
    bool utf32 = false;
    std::vector<const char*> files;
    for (int i = 2; i < argc; ++i) {
        if (strcmp(argv[i], "--utf32") == 0)
            utf32 = true;
        else
            files.push_back(argv[i]);
    }
    if (files.size() != 2)
        return UsageError("strings needs <strings.xml> <out>", kStringsHelp);
    std::string xml;
    if (!ox::misc::sys::ReadWholeFile(files[0], xml)) {
        fprintf(stderr, "oxdump: cannot read %s\n", files[0]);
        return 1;
    }
    std::vector<std::pair<int, ox::wstring>> texts;
    if (!CStringTable::ParseXml(xml.data(), xml.size(), files[0], texts)) {
        fprintf(stderr, "oxdump: %s is not valid\n", files[0]);
        return 1;
    }
    std::vector<uint8_t> bytes = CStringTable::BuildBinary16(texts, "S16\x01");
    if (utf32) {
        CStringTable table;
        table.BuildFromTexts(texts);
        bytes = table.BuildBinary32();
    }
    if (!ox::misc::sys::WriteFileAtomically(files[1], bytes.data(), bytes.size())) {
        fprintf(stderr, "oxdump: cannot write %s\n", files[1]);
        return 1;
    }
    printf("%s: %zu strings\n", files[1], texts.size());
    return 0;
}


// "--name value" options after the command; the rest are positional.
bool SplitOptions(int argc, char** argv, std::vector<std::string>& positional,
                  std::vector<std::pair<std::string, std::string>>& options, const std::vector<std::string>& known,
                  std::string& error)
{
    for (int i = 2; i < argc; ++i) {
        std::string arg = argv[i];
        if (arg.rfind("--", 0) != 0) {
            positional.push_back(arg);
            continue;
        }
        if (std::find(known.begin(), known.end(), arg) == known.end() || i + 1 >= argc) {
            error = "bad option " + arg;
            return false;
        }
        options.emplace_back(arg, argv[++i]);
    }
    return true;
}

int Resources(int argc, char** argv)
{
    std::vector<std::string> files;
    std::vector<std::pair<std::string, std::string>> options;
    std::string error;
    if (!SplitOptions(argc, argv, files, options, {"--root"}, error))
        return UsageError(error, kResourcesHelp);
    if (files.size() != 2)
        return UsageError("resources needs <resources.xml> <out>", kResourcesHelp);
    std::string xml;
    if (!ox::misc::sys::ReadWholeFile(files[0], xml)) {
        fprintf(stderr, "oxdump: cannot read %s\n", files[0].c_str());
        return 1;
    }
    fs::path root = fs::absolute(files[0]).parent_path();
    if (root.filename() == "properties")
        root = root.parent_path();
    for (const auto& [name, value] : options)
        if (name == "--root")
            root = value;
    ox::misc::GamePackConfig config;
    config.folder = root.string();
    config.language = "";
    ox::misc::CGamePack pack(config);
    ox::core::CTextureDeclarationsLoader loader(&pack);
    std::vector<uint8_t> bulk;
    if (!loader.ConvertXml(xml.data(), xml.size(), files[0].c_str(), bulk)) {
        fprintf(stderr, "oxdump: %s is not valid\n", files[0].c_str());
        return 1;
    }
    if (!ox::misc::sys::WriteFileAtomically(files[1], bulk.data(), bulk.size())) {
        fprintf(stderr, "oxdump: cannot write %s\n", files[1].c_str());
        return 1;
    }
    const auto* header = reinterpret_cast<const ox::core::CTextureDeclarationsLoader::Header*>(bulk.data());
    printf("%s: %u surfaces, %u groups, %u images, %zu bytes\n", files[1].c_str(), header->surfaces_amount,
           header->groups_amount, header->images_amount, bulk.size());
    return 0;
}

bool IsImageFile(const fs::path& path)
{
    std::string extension = path.extension().string();
    std::transform(extension.begin(), extension.end(), extension.begin(), ::tolower);
    return extension == ".png" || extension == ".jpg";
}

int TexturesAlpha(int argc, char** argv)
{
    std::vector<std::string> files;
    std::vector<std::pair<std::string, std::string>> options;
    std::string error;
    if (!SplitOptions(argc, argv, files, options, {"--order"}, error))
        return UsageError(error, kTexturesAlphaHelp);
    if (files.size() != 2)
        return UsageError("texturesalpha needs <folder|list> <out>", kTexturesAlphaHelp);
    int order = 0;
    for (const auto& [name, value] : options) {
        order = ox::core::AlphaMaskOrder(value);
        if (order < 0)
            return UsageError("bad order " + value, kTexturesAlphaHelp);
    }
    // Every image, sorted by path so that the run is the same each time.
    std::vector<ox::core::AlphaMaskFile> images;
    std::error_code fsError;
    if (fs::is_directory(files[0], fsError)) {
        for (const auto& entry : fs::recursive_directory_iterator(files[0], fsError))
            if (entry.is_regular_file() && IsImageFile(entry.path()))
                images.push_back({entry.path().stem().string(), entry.path().string()});
        std::sort(images.begin(), images.end(), [](const auto& a, const auto& b) { return a.path < b.path; });
    } else {
        std::string list;
        if (!ox::misc::sys::ReadWholeFile(files[0], list)) {
            fprintf(stderr, "oxdump: cannot read %s\n", files[0].c_str());
            return 1;
        }
        const fs::path base = fs::path(files[0]).parent_path();
        std::istringstream lines(list);
        for (std::string line; std::getline(lines, line);) {
            while (!line.empty() && (line.back() == '\r' || line.back() == ' ' || line.back() == '\t'))
                line.pop_back();
            if (line.empty() || line[0] == '#')
                continue;
            size_t equals = line.find('=');
            std::string path = equals == std::string::npos ? line : line.substr(equals + 1);
            std::string id = equals == std::string::npos ? fs::path(path).stem().string() : line.substr(0, equals);
            images.push_back({id, (base / path).string()});
        }
    }
    if (images.empty()) {
        fprintf(stderr, "oxdump: no images in %s\n", files[0].c_str());
        return 1;
    }
    size_t size = 0;
    if (!ox::core::WriteTexturesAlpha(images, order, files[1], error, &size)) {
        fprintf(stderr, "oxdump: %s\n", error.c_str());
        return 1;
    }
    printf("%s: %zu masks, %zu bytes\n", files[1].c_str(), images.size(), size);
    return 0;
}

int Sounds(int argc, char** argv)
{
    if (argc != 4)
        return UsageError("sounds needs <sounds.xml> <out>", kSoundsHelp);
    std::string xml;
    if (!ox::misc::sys::ReadWholeFile(argv[2], xml)) {
        fprintf(stderr, "oxdump: cannot read %s\n", argv[2]);
        return 1;
    }
    std::vector<uint8_t> block;
    if (!ox::sound::SoundDeclarationsLoader::ConvertXml(xml.data(), xml.size(), argv[2], block)) {
        fprintf(stderr, "oxdump: %s is not valid\n", argv[2]);
        return 1;
    }
    if (!ox::misc::sys::WriteFileAtomically(argv[3], block.data(), block.size())) {
        fprintf(stderr, "oxdump: cannot write %s\n", argv[3]);
        return 1;
    }
    printf("%s: %zu sounds, %zu bytes\n", argv[3], (block.size() - 8) / sizeof(ox::sound::SoundRecord),
           block.size());
    return 0;
}

void ShowSounds(const uint8_t* data)
{
    const auto* header = reinterpret_cast<const ox::sound::SoundDeclarationsHeader*>(data);
    const auto* records = reinterpret_cast<const ox::sound::SoundRecord*>(header + 1);
    printf("sound declarations: %u sounds\n", header->count);
    for (uint32_t i = 0; i < header->count; ++i) {
        const ox::sound::SoundRecord& r = records[i];
        printf("sound %s file %s group %s balance %g volume %g priority %d repeat %d max %d delay %g speed %g "
               "flags %u\n",
               r.id.c_str(), r.file.c_str(), r.group_template.c_str(), r.balance, r.volume, r.priority, r.repeat,
               r.max_concurrent_sound_play, r.concurrent_sound_play_delay, r.speed, r.flags);
    }
}

const char* AnimName(uint32_t type)
{
    static const char* names[] = {"none", "once", "loop", "pingpong", "backward loop", "backward pingpong"};
    return type < 6 ? names[type] : "?";
}

void ShowResources(const ox::core::CTextureDeclarationsLoader& loader)
{
    using Loader = ox::core::CTextureDeclarationsLoader;
    const Loader::Header* header = loader.Data();
    printf("texture declarations, revision %u: %u surfaces, %u groups, %u images\n", header->magic >> 24,
           header->surfaces_amount, header->groups_amount, header->images_amount);
    const Loader::SurfaceRecord* surfaces = loader.Surfaces();
    for (uint32_t i = 0; i < loader.SurfacesAmount(); ++i)
        printf("surface %s %ux%u format %u flags %u\n", surfaces[i].path.c_str(), surfaces[i].width,
               surfaces[i].height, surfaces[i].internal_format, surfaces[i].flags);
    const Loader::GroupRecord* groups = loader.Groups();
    for (uint32_t i = 0; i < loader.GroupsAmount(); ++i) {
        const Loader::GroupRecord* parent = loader.Group(groups[i].parent);
        printf("group %s flags %u parent %s\n", groups[i].id.c_str(), groups[i].flags,
               parent ? parent->id.c_str() : "-");
    }
    const Loader::ImageEntry* images = loader.Images();
    for (uint32_t i = 0; i < loader.ImagesAmount(); ++i) {
        const Loader::TextureDesc* desc = loader.Desc(images[i]);
        const Loader::GroupRecord* group = loader.Group(images[i].group);
        printf("image %s surface %s group %s frame %ux%u cols %u rows %u anim %s flags %u total %ums\n",
               images[i].id.c_str(), surfaces[loader.SurfaceIndex(*desc)].path.c_str(),
               group ? group->id.c_str() : "-", desc->frame_width, desc->frame_height, desc->cols, desc->rows,
               AnimName(desc->anim_type), desc->flags, desc->total_time);
        printf("  delays");
        for (unsigned d = 0; d < desc->frame_delays_count; ++d)
            printf(" %u", desc->frame_delays[d]);
        printf("\n  frame map");
        for (unsigned m = 0; m < desc->frame_map_length; ++m)
            printf(" %d", desc->frame_map[m]);
        printf("\n");
        for (unsigned p = 0; p < desc->parts_amount; ++p) {
            const ox::graphics::UVRect& uv = desc->Parts()[p];
            printf("  part %g %g %g %g\n", uv.u1, uv.v1, uv.u2, uv.v2);
        }
    }
}

void ShowAlpha(const ox::core::CTexturesAlpha& store)
{
    printf("alpha masks, revision 1: %u masks\n", store.Count());
    for (uint32_t r = 0; r < store.Count(); ++r)
        printf("mask %s\n", ox::core::DescribeMask(store.Records()[r]).c_str());
}

uint32_t ReadU32(const uint8_t* p)
{
    uint32_t value;
    memcpy(&value, p, 4);
    return value;
}

// The 32-bit string table is checked here: it has no reader in the game.
bool ShowStrings32(const uint8_t* data, size_t size, const char* name)
{
    const uint32_t count = ReadU32(data + 4);
    if (count > (size - 8) / 8) {
        fprintf(stderr, "oxdump: %s: %u entries do not fit in %zu bytes\n", name, count, size);
        return false;
    }
    printf("strings, 32-bit: %u\n", count);
    for (uint32_t i = 0; i < count; ++i) {
        const int id = static_cast<int>(ReadU32(data + 8 + 8 * i));
        const uint32_t offset = ReadU32(data + 8 + 8 * i + 4);
        std::u32string text;
        size_t at = offset;
        bool terminated = false;
        for (; at + 4 <= size; at += 4) {
            const uint32_t c = ReadU32(data + at);
            if (c == 0) {
                terminated = true;
                break;
            }
            text.push_back(c);
        }
        if (offset < 8 + 8ull * count || !terminated) {
            fprintf(stderr, "oxdump: %s: entry %u points outside the table\n", name, i);
            return false;
        }
        ox::wstring wide;
        for (char32_t c : text) {
            if (c >= 0x10000) {
                wide.push_back(static_cast<char16_t>(0xD800 + ((c - 0x10000) >> 10)));
                wide.push_back(static_cast<char16_t>(0xDC00 + ((c - 0x10000) & 0x3FF)));
            } else {
                wide.push_back(static_cast<char16_t>(c));
            }
        }
        printf("%d: %s\n", id, ox::misc::WideToUtf8(wide).c_str());
    }
    return true;
}

void ShowStrings16(const uint8_t* data, uint32_t count)
{
    printf("strings, 16-bit: %u\n", count);
    for (uint32_t i = 0; i < count; ++i) {
        const int id = static_cast<int>(ReadU32(data + 8 + 8 * i));
        const auto* text = reinterpret_cast<const char16_t*>(data + ReadU32(data + 8 + 8 * i + 4));
        printf("%d: %s\n", id, ox::misc::WideToUtf8(ox::wstring(text)).c_str());
    }
}

int Show(int argc, char** argv)
{
    if (argc != 3)
        return UsageError("show needs one file", kShowHelp);
    const std::string path = argv[2];
    std::string bytes;
    if (!ox::misc::sys::ReadWholeFile(path, bytes)) {
        fprintf(stderr, "oxdump: cannot read %s\n", path.c_str());
        return 1;
    }
    // The dumps are read in place as records: keep them aligned as a mapping would be.
    std::vector<uint32_t> words((bytes.size() + 3) / 4 + 1, 0);
    memcpy(words.data(), bytes.data(), bytes.size());
    const auto* data = reinterpret_cast<const uint8_t*>(words.data());
    const size_t size = bytes.size();
    if (size < 8) {
        fprintf(stderr, "oxdump: %s is too short for any dump\n", path.c_str());
        return 1;
    }
    const uint32_t magic = ReadU32(data);
    bool ok = false;
    if ((magic & 0xFFFFFF) == (ox::core::CTextureDeclarationsLoader::Magic & 0xFFFFFF)) {
        ox::core::CTextureDeclarationsLoader loader;
        if ((ok = loader.LoadFromMemory(data, size, path.c_str())))
            ShowResources(loader);
    } else if ((magic & 0xFFFFFF) == (ox::core::g_Magick & 0xFFFFFF)) {
        ox::core::CTexturesAlpha store;
        if ((ok = store.LoadFromMemory(data, size, path.c_str())))
            ShowAlpha(store);
    } else if (magic == qe::dump::kMagic) {
        ok = oxdump::ShowQuest(data, size, path.c_str());
    } else if (magic == ox::misc::anim::kClipsMagic) {
        ok = oxdump::ShowClips(data, size, path.c_str());
    } else if (magic == ox::core::kParticlesMagic) {
        ok = oxdump::ShowParticles(data, size, path.c_str());
    } else if (memcmp(data, "S16\x01", 4) == 0 || memcmp(data, "S16L", 4) == 0) {
        CStringTable table;
        if ((ok = table.UseTable(data, size, path.c_str())))
            ShowStrings16(data, table.GetCount());
    } else if (memcmp(data, "S32L", 4) == 0) {
        ok = ShowStrings32(data, size, path.c_str());
    } else if (memcmp(data, "SNDS", 4) == 0) {
        if ((ok = ox::sound::SoundDeclarationsLoader::Check(data, size, path.c_str())))
            ShowSounds(data);
    } else {
        fprintf(stderr, "oxdump: %s: unknown kind of dump (first word 0x%08X)\n", path.c_str(), magic);
        return 1;
    }
    if (!ok) {
        fprintf(stderr, "oxdump: %s is not valid\n", path.c_str());
        return 1;
    }
    return 0;
}

bool WantsHelp(int argc, char** argv)
{
    for (int i = 2; i < argc; ++i)
        if (strcmp(argv[i], "--help") == 0 || strcmp(argv[i], "-h") == 0)
            return true;
    return false;
}

} // namespace

int main(int argc, char** argv)
{
    if (argc < 2)
        return UsageError("no command");
    const std::string command = argv[1];
    if (command == "--help" || command == "-h") {
        fputs(kUsage, stdout);
        return 0;
    }
    struct Command {
        const char* name;
        int (*run)(int, char**);
        const char* help;
    } commands[] = {
        {"strings", Strings, kStringsHelp},
        {"resources", Resources, kResourcesHelp},
        {"texturesalpha", TexturesAlpha, kTexturesAlphaHelp},
        {"clips", oxdump::Clips, oxdump::kClipsHelp},
        {"particles", oxdump::Particles, oxdump::kParticlesHelp},
        {"sounds", Sounds, kSoundsHelp},
        {"quest", oxdump::Quest, oxdump::kQuestHelp},
        {"show", Show, kShowHelp},
    };
    for (const Command& c : commands) {
        if (command != c.name)
            continue;
        if (WantsHelp(argc, argv)) {
            fputs(c.help, stdout);
            return 0;
        }
        oxtools::LogToStderr log("oxdump");
        return c.run(argc, argv);
    }
    return UsageError("unknown command " + command);
}

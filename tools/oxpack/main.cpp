// oxpack: the game maker's tool for game.pack. Builds a pack from a folder, lists one,
// and extracts one into a folder, with the same code the game reads packs with.
#include "misc/GamePack.h"
#include "misc/PackWriter.h"
#include "misc/sys/Path.h"

#include <cstdio>
#include <cstring>
#include <filesystem>
#include <string>

namespace fs = std::filesystem;
using namespace ox::misc;

namespace {

const char* kUsage =
    "usage: oxpack build <folder> <game.pack>   pack every file under the folder\n"
    "       oxpack list <game.pack>             one line per entry: path, size, CRC\n"
    "       oxpack extract <game.pack> <folder> write every entry under the folder\n"
    "       oxpack --help\n"
    "\n"
    "Paths in the pack are relative to the folder, with \"/\" between components.\n"
    "Files under <folder>/!langs/<language>/ are that language's translations of the\n"
    "files of the same path. list prints path, size and CRC separated by tabs; the CRC\n"
    "is the game's file CRC (reflected CRC-32 table, start 0, no final inversion),\n"
    "in hexadecimal.\n";

int UsageError(const char* message)
{
    fprintf(stderr, "oxpack: %s\n%s", message, kUsage);
    return 2;
}

// The pack as the game reads it, without a language or loose files.
bool OpenPack(const char* file, CGamePack*& pack)
{
    GamePackConfig config;
    config.packFile = file;
    config.language = "";
    pack = new CGamePack(config);
    if (pack->HasPack())
        return true;
    fprintf(stderr, "oxpack: %s: %s\n", file, pack->PackError().c_str());
    delete pack;
    pack = nullptr;
    return false;
}

int Build(const char* folder, const char* packFile)
{
    CPackWriter writer;
    if (!writer.AddFolder(folder, packFile) || !writer.Write(packFile)) {
        fprintf(stderr, "oxpack: %s\n", writer.Error().c_str());
        return 1;
    }
    printf("%s: %zu files\n", packFile, writer.Count());
    return 0;
}

int List(const char* packFile)
{
    CGamePack* pack;
    if (!OpenPack(packFile, pack))
        return 1;
    const PackEntry* entries = pack->Entries();
    for (uint32_t i = 0; i < pack->EntryCount(); ++i) {
        const PackEntry& entry = entries[i];
        printf("%s\t%u\t%08x\n", entry.path.c_str(), entry.size,
               sys::CalcCRC(pack->EntryData(entry), entry.size));
    }
    delete pack;
    return 0;
}

int Extract(const char* packFile, const char* folder)
{
    CGamePack* pack;
    if (!OpenPack(packFile, pack))
        return 1;
    int result = 0;
    const PackEntry* entries = pack->Entries();
    for (uint32_t i = 0; i < pack->EntryCount(); ++i) {
        const PackEntry& entry = entries[i];
        std::string path = entry.path.c_str();
        // A pack from elsewhere must not write outside the folder.
        std::string why = CPackWriter::CheckPath(path);
        if (!why.empty()) {
            fprintf(stderr, "oxpack: %s: skipped: %s\n", path.c_str(), why.c_str());
            result = 1;
            continue;
        }
        fs::path target = fs::path(folder) / path;
        std::error_code error;
        fs::create_directories(target.parent_path(), error);
        FILE* out = fopen(target.c_str(), "wb");
        bool ok = out && (entry.size == 0 || fwrite(pack->EntryData(entry), 1, entry.size, out) == entry.size);
        if (out && fclose(out) != 0)
            ok = false;
        if (!ok) {
            fprintf(stderr, "oxpack: %s: cannot be written\n", target.c_str());
            result = 1;
        }
    }
    delete pack;
    return result;
}

} // namespace

int main(int argc, char** argv)
{
    if (argc < 2)
        return UsageError("no command given");
    std::string command = argv[1];
    if (command == "--help" || command == "-h" || command == "help") {
        fputs(kUsage, stdout);
        return 0;
    }
    if (command == "build" && argc == 4)
        return Build(argv[2], argv[3]);
    if (command == "list" && argc == 3)
        return List(argv[2]);
    if (command == "extract" && argc == 4)
        return Extract(argv[2], argv[3]);
    if (command == "build" || command == "list" || command == "extract")
        return UsageError(("wrong number of arguments for " + command).c_str());
    return UsageError(("unknown command " + command).c_str());
}

// oxdump: compiles game data into the binary forms the game reads in place.
#include "diag/Log.h"
#include "misc/StringTable.h"

#include <cstdio>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <string>
#include <unistd.h>

namespace fs = std::filesystem;
using ox::misc::CStringTable;

namespace {

const char* kUsage =
    "usage: oxdump strings <strings.xml> <out>   compile the string table\n"
    "       oxdump --help\n"
    "\n"
    "strings: reads elements with an id attribute and a UTF-8 text, e.g.\n"
    "  <strings><s id=\"12\">Open the door</s></strings>\n"
    "and writes the 16-bit table the game reads in place. Name the output\n"
    "properties/strings.bindump (or properties/strings.xml.bin_utf16le); with --utf32\n"
    "it writes the 32-bit form instead.\n";

int UsageError(const char* message)
{
    fprintf(stderr, "oxdump: %s\n%s", message, kUsage);
    return 2;
}

bool ReadWhole(const char* path, std::string& out)
{
    std::ifstream in(path, std::ios::binary);
    if (!in)
        return false;
    std::stringstream buffer;
    buffer << in.rdbuf();
    out = buffer.str();
    return true;
}

// Writes beside the target, then renames: a failed run leaves the old file.
bool WriteAtomically(const char* path, const std::vector<uint8_t>& bytes)
{
    std::string temporary = std::string(path) + ".tmp";
    {
        std::ofstream out(temporary, std::ios::binary | std::ios::trunc);
        if (!out)
            return false;
        out.write(reinterpret_cast<const char*>(bytes.data()), static_cast<std::streamsize>(bytes.size()));
        if (!out.flush())
            return false;
    }
    std::error_code error;
    fs::rename(temporary, path, error);
    return !error;
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
        return UsageError("strings needs <strings.xml> <out>");
    std::string xml;
    if (!ReadWhole(files[0], xml)) {
        fprintf(stderr, "oxdump: cannot read %s\n", files[0]);
        return 1;
    }
    // Parse problems go to the log; show them on standard error for the maker.
    std::string logPath = (fs::temp_directory_path() / ("oxdump-" + std::to_string(getpid()) + ".log")).string();
    ox::diag::Log::Instance().SetFile(logPath);
    std::vector<std::pair<int, ox::wstring>> texts;
    bool ok = CStringTable::ParseXml(xml.data(), xml.size(), files[0], texts);
    ox::diag::Log::Instance().Close();
    if (!ok) {
        std::string log;
        ReadWhole(logPath.c_str(), log);
        fprintf(stderr, "oxdump: %s is not valid\n", files[0]);
        std::istringstream lines(log);
        for (std::string line; std::getline(lines, line);)
            if (line.find("][3]: ") != std::string::npos)
                fprintf(stderr, "  %s\n", line.substr(line.find("][3]: ") + 6).c_str());
        fs::remove(logPath);
        return 1;
    }
    fs::remove(logPath);
    std::vector<uint8_t> bytes = CStringTable::BuildBinary16(texts, "S16\x01");
    if (utf32) {
        CStringTable table;
        table.BuildFromTexts(texts);
        bytes = table.BuildBinary32();
    }
    if (!WriteAtomically(files[1], bytes)) {
        fprintf(stderr, "oxdump: cannot write %s\n", files[1]);
        return 1;
    }
    printf("%s: %zu strings\n", files[1], texts.size());
    return 0;
}

} // namespace

int main(int argc, char** argv)
{
    if (argc < 2)
        return UsageError("no command");
    if (strcmp(argv[1], "--help") == 0 || strcmp(argv[1], "-h") == 0) {
        fputs(kUsage, stdout);
        return 0;
    }
    if (strcmp(argv[1], "strings") == 0) {
        if (argc == 3 && strcmp(argv[2], "--help") == 0) {
            fputs(kUsage, stdout);
            return 0;
        }
        return Strings(argc, argv);
    }
    return UsageError((std::string("unknown command ") + argv[1]).c_str());
}

// oxlint: checks a game folder's data before a player meets it.
#include "common/LogToStderr.h"
#include "oxlint/Lint.h"

#include <cstdio>
#include <cstring>
#include <filesystem>
#include <string>

namespace {

const char* kHelp =
    "usage: oxlint <game folder>\n"
    "\n"
    "Checks a game folder and prints one line \"file:line: what\" per mistake; the exit\n"
    "status is 1 when there is any, 0 when there is none, 2 for a bad command line.\n"
    "\n"
    "  - every .xml file parses as the game parses it;\n"
    "  - every texture, font, clip, particle system, sound, video, template, effect and\n"
    "    string id that the data names is declared (properties/resources.xml, fonts.xml,\n"
    "    clips.xml or clips/, particle.xml or particles/, sounds.xml, guitemplates.xml,\n"
    "    effects.xml, strings.xml), and so is the one a script passes as a literal to a\n"
    "    call it knows (audio Play(\"id\"), GetTexture(\"id\"), OpenWindow(\"id\"),\n"
    "    LoadScript(\"file\"), GetString(12), any text \"$12\" ...);\n"
    "  - the files the declarations name exist, loose or in game.pack;\n"
    "  - every .lua file compiles, and so do the scripts of properties/quest.xml as the\n"
    "    engine wraps them into functions;\n"
    "  - the binary dumps in properties/ (resources, clips, particles, sounds, strings,\n"
    "    quest, texturesalpha) agree with what oxdump makes from their XML now.\n";

} // namespace

int main(int argc, char** argv)
{
    if (argc == 2 && (strcmp(argv[1], "--help") == 0 || strcmp(argv[1], "-h") == 0)) {
        fputs(kHelp, stdout);
        return 0;
    }
    if (argc != 2 || argv[1][0] == '-') {
        fprintf(stderr, "oxlint: give one game folder\n%s", kHelp);
        return 2;
    }
    std::error_code error;
    if (!std::filesystem::is_directory(argv[1], error)) {
        fprintf(stderr, "oxlint: %s is not a folder\n", argv[1]);
        return 2;
    }
    oxlint::CLinter linter(argv[1]);
    {
        // What the engine's loaders log while the dumps are compiled again shows after the lines.
        oxtools::LogToStderr log("oxlint");
        linter.Run();
    }
    for (const oxlint::Message& message : linter.Messages())
        printf("%s\n", message.Format().c_str());
    const size_t count = linter.Messages().size();
    if (count)
        fprintf(stderr, "oxlint: %zu mistake%s in %s\n", count, count == 1 ? "" : "s", argv[1]);
    return count ? 1 : 0;
}

#include "oxdump/Quest.h"

#include "core/Settings.h"
#include "misc/Unicode.h"
#include "misc/sys/Path.h"
#include "quest/QuestData.h"

#include <cstdio>
#include <string>

namespace oxdump {

const char* const kQuestHelp =
    "usage: oxdump quest <quest.xml> <quest.bindump>\n"
    "\n"
    "Compiles the quest (a <Quest> root holding levels, scenes, objects, groups and areas)\n"
    "into properties/quest.bindump, the block the game walks in place; the game compiles the\n"
    "same block from quest.xml at start when the dump is missing. The dump leaves out the\n"
    "sounds of levels and objects and the editor flags. An object of an unknown type is\n"
    "reported and left out.\n";

int Quest(int argc, char** argv)
{
    if (argc != 4) {
        fprintf(stderr, "oxdump: quest needs <quest.xml> <quest.bindump>\n%s", kQuestHelp);
        return 2;
    }
    const std::string in = argv[2], out = argv[3];
    ox::core::CSettings settings;
    if (!settings.LoadXmlDirect(ox::misc::ConvertToWide(in))) {
        fprintf(stderr, "oxdump: cannot read %s\n", in.c_str());
        return 1;
    }
    const ox::core::CSettingsGroup* quest = settings.GetChildRef("Quest");
    if (!quest) {
        fprintf(stderr, "oxdump: %s has no <Quest> root\n", in.c_str());
        return 1;
    }
    const std::vector<uint8_t> block = qe::dump::Compile(*quest, in.c_str());
    if (!ox::misc::sys::WriteFileAtomically(out, block.data(), block.size())) {
        fprintf(stderr, "oxdump: cannot write %s\n", out.c_str());
        return 1;
    }
    printf("%s", qe::dump::Describe(block.data(), block.size()).c_str());
    return 0;
}

bool ShowQuest(const uint8_t* data, size_t size, const char* name)
{
    bool intact = false;
    const std::string text = qe::dump::Describe(data, size, &intact);
    printf("quest %s\n%s", name, text.c_str());
    return intact;
}

} // namespace oxdump

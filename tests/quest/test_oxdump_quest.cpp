// oxdump quest compiles with the game's compiler; oxdump show describes the dump.
#include "core/Settings.h"
#include "misc/Unicode.h"
#include "quest/Level.h"
#include "quest/QuestData.h"
#include "support/TestSupport.h"

#include <cstdlib>
#include <sys/wait.h>

namespace {

// Runs oxdump with the arguments; the exit status and what it printed.
std::pair<int, std::string> Oxdump(const oxtest::TempDir& dir, const std::string& arguments)
{
    const std::string output = (dir / "oxdump.txt").string();
    const int status = system((std::string(OX_TOOLS_DIR) + "/oxdump " + arguments + " >'" + output + "' 2>&1").c_str());
    return {WEXITSTATUS(status), oxtest::ReadFile(output)};
}

} // namespace

TEST(OxdumpQuest, CompilesTheDemoQuestAsTheGameDoesAndShowsIt)
{
    oxtest::TempDir dir;
    const std::string xml = std::string(OX_DEMO_GAME) + "/properties/quest.xml";
    const std::string out = (dir / "quest.bindump").string();
    auto [status, text] = Oxdump(dir, "quest '" + xml + "' '" + out + "'");
    ASSERT_EQ(status, 0) << text;

    ox::core::CSettings settings;
    ASSERT_TRUE(settings.LoadXmlDirect(ox::misc::ConvertToWide(xml)));
    const std::vector<uint8_t> block = qe::dump::Compile(settings.GetChild("Quest"), "quest.xml");
    const std::string written = oxtest::ReadFile(out);
    EXPECT_TRUE(written == std::string(block.begin(), block.end()));

    qe::CQuestData data;
    data.SetBlock(std::vector<uint8_t>(written.begin(), written.end()));
    qe::LevelPtrT level(data.CreateLevel("level1"));
    ASSERT_TRUE(level);
    EXPECT_EQ(level->EnumScenes(), 3u);
    EXPECT_TRUE(level->FindObjectById("lamp_on", true, false));

    std::tie(status, text) = Oxdump(dir, "show '" + out + "'");
    EXPECT_EQ(status, 0) << text;
    EXPECT_NE(text.find("level 'level1': 3 scenes"), std::string::npos) << text;
    EXPECT_NE(text.find("scene 'garden': flags 1, 8 objects, 1 areas"), std::string::npos) << text;

    // A cut dump is described as damaged and refused.
    dir.Write("cut.bindump", written.substr(0, written.size() - 40));
    std::tie(status, text) = Oxdump(dir, "show '" + (dir / "cut.bindump").string() + "'");
    EXPECT_NE(status, 0);
    EXPECT_NE(text.find("damaged"), std::string::npos) << text;
}

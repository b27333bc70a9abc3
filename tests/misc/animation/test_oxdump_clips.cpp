// The dump tool's clips: what it compiles is the bulk the game builds from the same XML,
// and `show` describes it.
#include "misc/GamePack.h"
#include "misc/animation/ClipsLoader.h"
#include "support/TestSupport.h"

#include <cstring>
#include <sys/wait.h>

using namespace ox::misc::anim;

namespace {

int RunDump(const std::string& arguments, std::string& output)
{
    oxtest::TempDir dir;
    const std::string file = (dir / "out").string();
    const int status = system((std::string(OX_OXDUMP_PATH) + " " + arguments + " >'" + file + "' 2>&1").c_str());
    output = oxtest::ReadFile(file);
    return WEXITSTATUS(status);
}

} // namespace

TEST(OxDumpClips, CompilesTheFolderTheGameWouldReadAndShowsIt)
{
    oxtest::TempDir game;
    oxtest::ScopedCwd cwd(game.Path());
    game.Write("clips/door.xml", R"(<?xml version="1.0"?><Clip id="door" w="64" h="32">
        <image id="leaf" i_id="door_leaf" vis="true" at="1"><kp t="0" itpl="true" p="1,2"/><kp t="250" a="0.5"/>
        <sd k="250" id="creak"/></image></Clip>)");
    game.Write("clips/lamp.xml", R"(<?xml version="1.0"?><Clip id="lamp" w="8" h="8"/>)");
    game.Write("clips/groups.xml", R"(<?xml version="1.0"?><Clip id="not_a_clip"/>)");

    std::string text;
    ASSERT_EQ(RunDump("clips clips clips.bindump", text), 0) << text;
    EXPECT_NE(text.find("clips.bindump: 2 clips"), std::string::npos) << text;

    ox::misc::GamePackConfig config;
    config.folder = game.Path().string();
    config.language = "";
    ox::misc::CGamePack pack(config);
    CClipsLoader loader(&pack);
    ASSERT_TRUE(loader.Load());
    ASSERT_TRUE(loader.IsBuiltFromXml());
    const std::string dump = oxtest::ReadFile(game / "clips.bindump");
    ASSERT_EQ(dump.size(), loader.DataSize());
    EXPECT_EQ(memcmp(dump.data(), loader.Data(), dump.size()), 0) << "one builder for the tool and the game";

    ASSERT_EQ(RunDump("show clips.bindump", text), 0) << text;
    EXPECT_NE(text.find("clips, revision 1: 2 clips\nclip door at 0,0 size 64x32"), std::string::npos) << text;
    EXPECT_NE(text.find("  image leaf at 0,0 angle 0 colour 0x00000000 flip 0 user 0 loop forward texture door_leaf"),
              std::string::npos) << text;
    EXPECT_NE(text.find("    key 250 at 0,0 k 0 angle 0.5"), std::string::npos) << text;
    EXPECT_NE(text.find("    sound 250 creak"), std::string::npos) << text;
    EXPECT_NE(text.find("clip lamp at 0,0 size 8x8, 120 bytes"), std::string::npos) << text;
}

TEST(OxDumpClips, BrokenInputIsReportedWithItsClip)
{
    oxtest::TempDir dir;
    oxtest::ScopedCwd cwd(dir.Path());
    dir.Write("bad.xml", R"(<?xml version="1.0"?><clips><Clip id="c"><sprite id="s"/></Clip></clips>)");
    std::string text;
    ASSERT_EQ(RunDump("clips bad.xml out.bindump", text), 0) << text;
    EXPECT_NE(text.find("clip 'c': unknown object kind 'sprite' is left out"), std::string::npos) << text;
    dir.Write("cut.xml", R"(<?xml version="1.0"?><clips><Clip id="c">)");
    EXPECT_EQ(RunDump("clips cut.xml out.bindump", text), 1) << text;
    // A dump cut short is refused by show as by the game.
    const std::string whole = oxtest::ReadFile(dir / "out.bindump");
    dir.Write("short.bindump", whole.substr(0, 60));
    EXPECT_EQ(RunDump("show short.bindump", text), 1) << text;
}

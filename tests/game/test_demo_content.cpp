// The demo game's generated textures and dumps are what the documented command makes.
#include "support/TestSupport.h"

#include <cstdlib>
#include <vector>
#include <sys/wait.h>

namespace fs = std::filesystem;

TEST(DemoContent, TexturesAndDumpsRegenerateByteForByte)
{
    oxtest::TempDir out;
    const std::string command = std::string("sh '") + OX_DEMO_GAME + "/make-textures.sh' '" + OX_TOOLS_DIR + "' '" +
                                out.Path().string() + "' >'" + (out / "log.txt").string() + "' 2>&1";
    const int status = system(command.c_str());
    ASSERT_EQ(WEXITSTATUS(status), 0) << oxtest::ReadFile(out / "log.txt");
    const char* files[] = {"textures/demo_spinner.png", "textures/demo_disc.png", "textures/demo_frame.png",
                           "textures/demo_stone.pvr", "textures/menu_button.png", "textures/menu_box.png",
                           "textures/menu_tick.png", "textures/menu_bar_frame.png", "textures/menu_bar.png",
                           "textures/menu_back.png", "textures/menu_tip_back.png", "textures/menu_arrow.png",
                           "properties/resources.bindump",
                           "properties/texturesalpha.bindump", "properties/clips.bindump",
                           "properties/particles.bindump"};
    for (const char* file : files) {
        ASSERT_TRUE(fs::exists(out / file)) << file;
        EXPECT_TRUE(oxtest::ReadFile(out / file) == oxtest::ReadFile(fs::path(OX_DEMO_GAME) / file))
            << file << " differs from what games/demo/make-textures.sh makes";
    }
}

TEST(DemoContent, SoundsAndTheirDumpRegenerateByteForByte)
{
    oxtest::TempDir out;
    const std::string command = std::string("sh '") + OX_DEMO_GAME + "/make-sounds.sh' '" + OX_TOOLS_DIR + "' '" +
                                out.Path().string() + "' >'" + (out / "log.txt").string() + "' 2>&1";
    ASSERT_EQ(WEXITSTATUS(system(command.c_str())), 0) << oxtest::ReadFile(out / "log.txt");
    // Every sound of the game folder, and the dump.
    std::vector<std::string> files {"properties/sounds.bindump"};
    for (const auto& entry : fs::directory_iterator(fs::path(OX_DEMO_GAME) / "sounds"))
        files.push_back("sounds/" + entry.path().filename().string());
    EXPECT_EQ(files.size(), 11u);
    for (const std::string& file : files) {
        ASSERT_TRUE(fs::exists(out / file)) << file;
        EXPECT_TRUE(oxtest::ReadFile(out / file) == oxtest::ReadFile(fs::path(OX_DEMO_GAME) / file))
            << file << " differs from what games/demo/make-sounds.sh makes";
    }
}

// The content checker: the demo and the template pass it, and a copy of the demo with one
// mistake of each kind gets each named with its file and line.
#include "support/TestSupport.h"

#include <sys/wait.h>

#include <algorithm>
#include <fstream>
#include <sstream>

namespace fs = std::filesystem;

namespace {

int RunShell(const std::string& command, std::string& output)
{
    oxtest::TempDir dir;
    const std::string file = (dir / "out").string();
    const int status = system((command + " >'" + file + "' 2>&1").c_str());
    output = oxtest::ReadFile(file);
    return WEXITSTATUS(status);
}

int RunLint(const std::string& arguments, std::string& output)
{
    return RunShell(std::string(OX_OXLINT_PATH) + " " + arguments, output);
}

// Replaces the first `from` in the file with `to` and returns "file:line" of the change.
std::string Break(const fs::path& game, const std::string& file, const std::string& from, const std::string& to)
{
    std::string text = oxtest::ReadFile(game / file);
    const size_t at = text.find(from);
    EXPECT_NE(at, std::string::npos) << from << " is not in " << file;
    if (at == std::string::npos)
        return "?";
    text.replace(at, from.size(), to);
    std::ofstream(game / file, std::ios::binary) << text;
    return file + ":" + std::to_string(1 + std::count(text.begin(), text.begin() + at, '\n'));
}

} // namespace

TEST(OxLint, TheDemoAndTheTemplatePassAndHelpIsShown)
{
    std::string output;
    EXPECT_EQ(RunLint(OX_DEMO_GAME, output), 0) << output;
    EXPECT_EQ(RunLint(OX_TEMPLATE_GAME, output), 0) << output;
    EXPECT_EQ(RunLint("--help", output), 0);
    EXPECT_NE(output.find("usage: oxlint <game folder>"), std::string::npos) << output;
    EXPECT_EQ(RunLint("", output), 2) << output;
}

TEST(OxLint, MakeNewGameCopiesTheTemplateUnderItsName)
{
    oxtest::TempDir games;
    const std::string make = "make -s -C '" OX_SOURCE_DIR "' new-game GAMES_DIR='" + games.Path().string() + "' NAME=";
    std::string output;
    ASSERT_EQ(RunShell(make + "moon_quest", output), 0) << output;
    EXPECT_NE(oxtest::ReadFile(games / "moon_quest/game.xml").find("product=\"moon_quest\""), std::string::npos);
    EXPECT_EQ(RunLint((games / "moon_quest").string(), output), 0) << output;
    EXPECT_NE(RunShell(make + "moon_quest", output), 0) << "an existing game is not overwritten: " << output;
    EXPECT_NE(RunShell(make + "'bad name'", output), 0) << output;
}

TEST(OxLint, NamesOneMistakeOfEachKind)
{
    oxtest::TempDir dir;
    const fs::path game = dir / "demo";
    fs::copy(OX_DEMO_GAME, game, fs::copy_options::recursive);

    struct Expected {
        std::string where, what;
    };
    std::vector<Expected> expected = {
        {Break(game, "properties/gui.xml", "frame=\"menu_bar_frame\"", "frame=\"menu_bar_framx\""),
         "names the texture 'menu_bar_framx', which is not declared"},
        {Break(game, "properties/guitemplates.xml", "font=\"title\"", "font=\"titel\""),
         "names the font 'titel'"},
        {Break(game, "properties/quest.xml", "clip_id=\"garden_fireflies\"", "clip_id=\"garden_firefly\""),
         "names the clip 'garden_firefly'"},
        {Break(game, "properties/clips.xml", "p_id=\"demo_embers\"", "p_id=\"demo_ember\""),
         "names the particle system 'demo_ember'"},
        {Break(game, "properties/guitemplates.xml", "open_sound=\"window_open\"", "open_sound=\"window_opne\""),
         "names the sound 'window_opne'"},
        {Break(game, "properties/gui.xml", "button_template=\"menu\"", "button_template=\"menuu\""),
         "names the template 'button_template:menuu'"},
        {Break(game, "properties/quest.xml", "hint=\"$301\"", "hint=\"$3019\""), "names the string '3019'"},
        {Break(game, "scripts/main.lua", "function Init()", "function Init() CVideoPlayer(\"videos/none.ogv\")"),
         "names the video 'videos/none.ogv', which is not in the game folder"},
        {Break(game, "scripts/main.lua", "audio.Play(\"music\"", "audio.Play(\"musik\""),
         "Play(...) names the sound 'musik'"},
        {Break(game, "properties/quest.xml", "s1=\"find(self) do return end\"", "s1=\"find(self) return end\""),
         "script s1 of 'coin' does not compile as the game wraps it"},
        {Break(game, "scripts/menu.lua", "function ", "function ("), "does not compile"},
        {"properties/sounds.bindump", "does not agree with properties/sounds.xml"},
        // A root left open: the parser names the line of the open element.
        {"properties/constants.xml:2", "does not parse: elements are not closed"},
    };
    Break(game, "properties/sounds.xml", "volume=\"100\"", "volume=\"90\"");
    Break(game, "properties/constants.xml", "</Constants>", "");

    std::string output;
    EXPECT_EQ(RunLint(game.string(), output), 1) << output;
    for (const Expected& e : expected) {
        bool found = false;
        std::istringstream lines(output);
        for (std::string line; std::getline(lines, line);)
            found = found || (line.rfind(e.where + ":", 0) == 0 && line.find(e.what) != std::string::npos);
        EXPECT_TRUE(found) << "no line '" << e.where << ": ..." << e.what << "' in\n" << output;
    }
}

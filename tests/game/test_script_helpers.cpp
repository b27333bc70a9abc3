// The game's small script helpers: the strips round a bordered clip, the signed value of a
// character, a text of the string table and opening a document.
#include "game/GameBinding.h"
#include "game/ScriptHelpers.h"
#include "graphics/Renderer.h"
#include "lua/Lua.h"
#include "lua/LuaTestHost.h"
#include "misc/Unicode.h"
#include "misc/animation/Clip.h"
#include "quest/QuestBinding.h"
#include "support/RecordingBackend.h"
#include "support/TestSupport.h"

using namespace k17;
using ox::misc::FloatRect;

namespace {

std::vector<FloatRect> Strips(float x, float y, float w, float h, bool drawn)
{
    ClipBorder border = ComputeClipBorder({x, y}, {w, h}, {1024, 768});
    EXPECT_EQ(border.DrawClip, drawn) << x << "," << y;
    return border.Strips;
}

} // namespace

TEST(BorderedClip, StripsCoverTheCanvasRoundTheClip)
{
    // Of the canvas size plus one: the clip covers everything.
    EXPECT_TRUE(Strips(0, 0, 1024, 768, true).empty());
    // Smaller and moved: top, left, right and bottom.
    EXPECT_EQ(Strips(100, 50, 200, 100, true),
              (std::vector<FloatRect> {{0, 0, 1024, 50}, {0, 50, 100, 100}, {300, 50, 1024, 100}, {0, 150, 1024, 768}}));
    // Above the top edge: no top strip, the sides start at 0.
    EXPECT_EQ(Strips(0, -40, 1024, 300, true), (std::vector<FloatRect> {{0, 260, 1024, 768}}));
    // Wholly outside: only the top strip, and the clip is not drawn.
    EXPECT_EQ(Strips(0, 900, 100, 100, false), (std::vector<FloatRect> {{0, 0, 1024, 900}}));
    EXPECT_TRUE(Strips(-500, -500, 100, 100, false).empty());
    EXPECT_TRUE(Strips(1024, 0, 100, 100, false).empty());
}

TEST(BorderedClip, FillsTheStripsInTheColourOnTheRenderer)
{
    oxtest::RecordingBackend* backend = nullptr;
    auto renderer = oxtest::MakeRecordingRenderer(backend, 1024, 768, 1024, 768);
    ASSERT_TRUE(renderer->BeginScene());
    backend->ClearRecord();
    ox::misc::anim::CClip clip;
    clip.SetSize({1025, 769});
    auto triangles = [&] {
        renderer->Flush();
        unsigned count = 0;
        for (const auto& draw : backend->draws)
            count += draw.primitives;
        return count;
    };
    RenderBorderedClip(renderer.get(), &clip, 0, 0, ox::graphics::Color(0xFF000000));
    EXPECT_EQ(triangles(), 0u);
    clip.SetSize({201, 101});
    RenderBorderedClip(renderer.get(), &clip, 100, -50, ox::graphics::Color(0xFF102030));
    EXPECT_EQ(triangles(), 6u);  // left, right and bottom
    ASSERT_FALSE(backend->draws.empty());
    EXPECT_EQ(backend->draws.back().vertices.front().diffuse, 0xFF102030u);
    // The renderer's state is as it was.
    EXPECT_EQ(renderer->GetColor().Red, 255);
}

TEST(ScriptHelpers, CharactersTextsAndDocumentsThroughScripts)
{
    oxtest::TempDir dir;
    oxtest::MessageCapture boxes;
    ox::lua::CLua lua("test_helpers_main", false);
    qe::BindFramework(lua);
    lua.BeginBinding();
    lua.Bind(BindGameClasses());
    lua.Bind(BindGameGlobals());
    lua.EndBinding();
    auto run = [&](lua_State* L, const std::string& code) { return oxtest::RunChunk(L, code); };
    EXPECT_EQ(run(lua.GetLuaState(), "return k17.CharToInt(string.char(200)) .. ' ' .. k17.CharToInt('A')"), "-56 65");
    EXPECT_EQ(CharToInt(static_cast<char>(0xFF)), -1);

    std::vector<std::string> opened;
    SetDocumentOpener([&](const std::string& url) { opened.push_back(url); });
    dir.Write("read me.txt", "hello");
    const std::string present = (dir / "read me.txt").string(), missing = (dir / "none.txt").string();
    run(lua.GetLuaState(), "k17.misc.ExecuteFile('" + missing + "') k17.misc.ExecuteFile('" + present + "')");
    SetDocumentOpener(nullptr);
    ASSERT_EQ(opened.size(), 1u);
    EXPECT_EQ(opened[0], "file://" + dir.Path().string() + "/read%20me.txt");
    EXPECT_EQ(FileUrl("/a/b#c%d"), "file:///a/b%23c%25d");

    // A level's state reaches the texts and the bordered clip once __QEBindGame ran for it.
    run(lua.GetLuaState(), "g_helpers_level = ox.lua.CLua('test_helpers_level', false) ox.lua.BindOX(g_helpers_level)"
                           " __QEBindGame(g_helpers_level)");
    ox::lua::CLua* level = ox::lua::CLua::GetLua("test_helpers_level");
    ASSERT_NE(level, nullptr);
    EXPECT_EQ(run(level->GetLuaState(), "return k17.misc.GetString(987654).c_str()"),
              "String \"$987654\" has not found!");
    EXPECT_EQ(run(level->GetLuaState(), "return type(k17.misc.RenderBorderedClip)"), "function");
    EXPECT_TRUE(boxes.Boxes().empty()) << boxes.Boxes().front().text;
}

// The framework's script vocabulary: every name in tests/lua/vocabulary.lua stands in a fresh
// host after BindOX with its overload count, and a few of the names do what they say.
#include "core/Application.h"
#include "core/ScriptVocabulary.h"
#include "lua/Lua.h"
#include "lua/LuaTestHost.h"
#include "support/TestSupport.h"
#include "support/VocabularyWalk.h"

#include <iostream>

using ox::lua::CLua;

namespace {

using oxtest::GroupResult;

struct VocabularyTest : ::testing::Test {
    oxtest::TempDir dir;
    oxtest::ScopedCwd cwd {dir.Path()};
    oxtest::LogCapture log;
    oxtest::MessageCapture boxes;
    CLua lua {"vocab", false};

    void SetUp() override { ox::core::BindOX(lua); }

    // Runs the walk of vocabulary.lua over one of its groups ("required", "controls",
    // "pending.video", ...) in the given host.
    static GroupResult Walk(mluabind::CHost& host, const std::string& group)
    {
        return oxtest::WalkVocabulary(host, OX_VOCABULARY_LUA, OX_VOCABULARY_LUA, group);
    }

    std::string Run(const std::string& code) { return oxtest::RunChunk(lua.GetLuaState(), code); }
};

TEST_F(VocabularyTest, EveryRequiredNameStandsWithItsOverloads)
{
    GroupResult required = Walk(lua, "required");
    EXPECT_EQ(required.problems, "");
    EXPECT_GT(required.found, 500);
    GroupResult controls = Walk(lua, "controls");
    EXPECT_EQ(controls.problems, "");
    EXPECT_EQ(controls.found, controls.wanted);
    EXPECT_EQ(Walk(lua, "not_built").found, 0);
    // Later work: reported, never failed.
    for (const char* group : {"pending.widgets"}) {
        GroupResult result = Walk(lua, group);
        std::cout << "[ vocabulary ] " << group << ": " << result.found << " of " << result.wanted << " names\n";
    }
    EXPECT_TRUE(boxes.Boxes().empty());
}

// A level's host is made and given the framework by a script, twice over: the second binding
// replaces the first.
TEST_F(VocabularyTest, ScriptsBindTheVocabularyIntoAnotherHost)
{
    EXPECT_EQ(Run("level = ox.lua.CLua('level', false) ox.lua.BindOX(level) ox.lua.BindOX(level) return 'ok'"), "ok");
    CLua* level = CLua::GetLua("level");
    ASSERT_NE(level, nullptr);
    EXPECT_EQ(Walk(*level, "required").problems, "");
    EXPECT_EQ(oxtest::RunChunk(level->GetLuaState(), "return ox.misc.FloatVector(1, 2).Y"), "2");
    EXPECT_TRUE(boxes.Boxes().empty());

    // No host given: a line in the log, and the script goes on.
    EXPECT_EQ(Run("ox.lua.BindOX(nil) return 'on'"), "on");
    EXPECT_TRUE(log.Contains("lua != nullptr"));
    EXPECT_EQ(Run("level = nil collectgarbage() return 'closed'"), "closed");
}

TEST_F(VocabularyTest, GeometryHelpersAnswerAsTheQuadsAndMatricesSay)
{
    EXPECT_EQ(Run("local m = ox.misc local p = m.Poly4FromRect(m.FloatRect(0, 0, 10, 10))"
                  " return tostring(p.IsContains(m.FloatVector(5, 5))) .. tostring(p.IsContains(m.FloatVector(15, 5)))"),
              "truefalse");
    // A quarter turn about (10, 10) takes (20, 10) to (10, 20).
    EXPECT_EQ(Run("local m = ox.misc local v = m.MatrixRotation(math.pi / 2, m.FloatVector(10, 10))"
                  ".Transform(m.FloatVector(20, 10)) return string.format('%.3f,%.3f', v.X, v.Y)"),
              "10.000,20.000");
    EXPECT_EQ(Run("local m = ox.misc local v = m.MatrixInvert(m.MatrixScale(2, 4)).Transform(m.FloatVector(2, 4))"
                  " return v.X .. ',' .. v.Y"),
              "1,1");
    // The foot of (5, 7) on the segment (0,0)-(10,0) is (5, 0); on (20,0)-(30,0) it lies outside.
    EXPECT_EQ(Run("local m = ox.misc local f = m.FloatVector() local on = m.GetOrthogonalPos(m.FloatVector(0, 0),"
                  " m.FloatVector(10, 0), m.FloatVector(5, 7), f) local off = m.GetOrthogonalPos(m.FloatVector(20, 0),"
                  " m.FloatVector(30, 0), m.FloatVector(5, 7), f) return tostring(on) .. f.X .. ',' .. f.Y .. tostring(off)"),
              "true5,0false");
    EXPECT_EQ(Run("local m = ox.misc local r = m.GetLinesIntersect(m.FloatVector(0, 0), m.FloatVector(10, 10),"
                  " m.FloatVector(0, 10), m.FloatVector(10, 0)) local q = m.GetLinesIntersect(m.FloatVector(0, 0),"
                  " m.FloatVector(1, 0), m.FloatVector(0, 1), m.FloatVector(1, 1))"
                  " return tostring(r.first) .. r.second .. tostring(q.first)"),
              "true0.5false");
    EXPECT_EQ(Run("local m = ox.misc local v = m.GetBezierPos(m.FloatVector(0, 0), m.FloatVector(0, 10),"
                  " m.FloatVector(10, 10), m.FloatVector(10, 0), 0.5) return v.X .. ',' .. v.Y"),
              "5,7.5");
    EXPECT_EQ(Run("local m = ox.misc local a = m.Poly4FromRect(m.FloatRect(0, 0, 10, 10))"
                  " local b = m.Poly4FromRect(m.FloatRect(8, 8, 10, 10)) local c = m.Poly4FromRect(m.FloatRect(2, 2, 2, 2))"
                  " local d = m.Poly4FromRect(m.FloatRect(20, 0, 5, 5))"
                  " return tostring(a.IsIntersects(b)) .. tostring(a.IsIntersects(c)) .. tostring(a.IsIntersects(d))"),
              "truetruefalse");
    // A location at (10, 0) with the contour of a 2 by 2 square: its corner (1, 1) of the unit
    // square lies at (12, 2) and back; the quad turned by a quarter is bounded by (-2, 0) 2 by 2.
    EXPECT_EQ(Run("local m = ox.misc local l = m.Location() l.Pos = m.FloatVector(10, 0)"
                  " l.Contour = m.Poly4FromRect(m.FloatRect(0, 0, 2, 2)) local a = l.GetAbsPos(m.FloatVector(1, 1))"
                  " local b = l.GetPolyPos(a) return a.X .. ',' .. a.Y .. ' ' .. b.X .. ',' .. b.Y .. ' ' .."
                  " tostring(l.IsContains(m.FloatVector(11, 1))) .. tostring(l.IsContains(m.FloatVector(1, 1)))"),
              "12,2 1,1 truefalse");
    EXPECT_EQ(Run("local m = ox.misc local l = m.Location() l.Contour = m.Poly4FromRect(m.FloatRect(0, 0, 2, 2))"
                  " l.Angle = math.pi / 2 local r = l.GetPoly().GetBoundingRect()"
                  " return string.format('%.0f,%.0f,%.0f,%.0f', r.X, math.abs(r.Y), r.Width, r.Height)"),
              "-2,0,2,2");
}

TEST_F(VocabularyTest, TextNumbersAndLogReachTheirServices)
{
    EXPECT_EQ(Run("return ox.misc.FormatString('%s has %d', 'lamp', 3).c_str()"), "lamp has 3");
    EXPECT_EQ(Run("return ox.misc.FormatString('%d-%s', 7, 'x').c_str()"), "7-x");
    EXPECT_EQ(Run("return ox.misc.BitwiseOr(5, 2) + ox.misc.BitwiseAnd(6, 3) + ox.misc.BitwiseXor(6, 3)"), "14");
    EXPECT_EQ(Run("return std.floor(2.7) + std.pow(2, 3) + std.abs(-1)"), "11");
    EXPECT_EQ(Run("local c = ox.graphics.Color(0x80FF2000) return c.Red .. ',' .. c.Green .. ',' .. c.Alpha"),
              "255,32,128");
    EXPECT_EQ(Run("return ox.misc.StringA24('lamp').c_str()"), "lamp");
    Run("ox.diag.LogA('vocab', ox.diag.LogInfo, 'at 100%% of %s') ox.diag.LogW('vocab', ox.diag.LogError, 'wide %d%%')");
    EXPECT_TRUE(log.Contains("[vocab][1]: at 100% of %s"));
    EXPECT_TRUE(log.Contains("[vocab][3]: wide %d%"));
    // Arguments no overload takes: the report, nil, and the script goes on.
    EXPECT_EQ(Run("return ox.misc.MatrixRotation('x', 'y', 'z') == nil"), "true");
    ASSERT_FALSE(boxes.Boxes().empty());
    EXPECT_NE(boxes.Boxes().back().text.find("no one can be used"), std::string::npos);
}

// An application that adds names of its own.
struct MarkedApplication : ox::core::CApplication {
    void BindScript(mluabind::CHost& host) override
    {
        host.Bind(mluabind::Namespace("game").AddConstant(mluabind::Constant("Marker", 17)));
    }
};

// With an application: g_Application is it, in the globals and under ox.core, its services
// answer, and its own binder runs after the framework's.
TEST(VocabularyWithApplication, ReachesTheApplicationAndRunsItsBinder)
{
    oxtest::TempDir dir;
    oxtest::ScopedCwd cwd {dir.Path()};
    oxtest::ScopedEnv xdg {"XDG_DATA_HOME", (dir / "data").c_str()};
    oxtest::MessageCapture boxes;
    dir.Write("game.xml", "<?xml version=\"1.0\"?><settings product=\"Quest\" debug=\"2\"/>");
    MarkedApplication app;
    CLua lua("app", false);
    ox::core::BindOX(lua);
    auto run = [&](const std::string& code) { return oxtest::RunChunk(lua.GetLuaState(), code); };
    EXPECT_EQ(run("return game.Marker"), "17");
    EXPECT_EQ(run("return ox.core.g_Application ~= nil and g_Application.GetDebugLevel()"), "2");
    EXPECT_EQ(run("return g_Application.GetSettings().GetChild('settings', false).GetValue('product').c_str()"), "Quest");
    EXPECT_EQ(run("local t = g_Application.GetTimeManager().AttachGroupTimer('vocab', nil) local id = t.GetId().c_str()"
                  " t.Destroy() return id"),
              "vocab");
    EXPECT_TRUE(boxes.Boxes().empty());
}

} // namespace

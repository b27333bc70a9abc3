// The game's script vocabulary: every name of tests/game/game_vocabulary.lua stands in the
// main state after the game's binders, and the level's share in a state given it by
// __QEBindGame from a script.
#include "game/GameBinding.h"
#include "game/MiniGameWidget.h"
#include "lua/Lua.h"
#include "lua/LuaTestHost.h"
#include "quest/QuestBinding.h"
#include "support/TestSupport.h"
#include "support/VocabularyWalk.h"


namespace {

oxtest::GroupResult Walk(mluabind::CHost& host, const std::string& group)
{
    return oxtest::WalkVocabulary(host, OX_VOCABULARY_LUA, OX_GAME_VOCABULARY_LUA, group);
}

} // namespace

TEST(GameVocabulary, TheMainAndTheLevelStatesHoldTheirNames)
{
    oxtest::MessageCapture boxes;
    ox::lua::CLua lua("test_vocab_main", false);
    qe::BindFramework(lua);
    lua.BeginBinding();
    lua.Bind(k17::BindGameClasses());
    lua.Bind(k17::BindGameGlobals());
    lua.EndBinding();
    for (const char* group : {"main", "achievements"}) {
        oxtest::GroupResult result = Walk(lua, group);
        EXPECT_EQ(result.problems, "") << group;
        EXPECT_EQ(result.found, result.wanted) << group;
        EXPECT_GT(result.found, 10) << group;
    }
    // Before __QEBindGame a new state has none of the level's names; after it, all.
    EXPECT_EQ(oxtest::RunChunk(lua.GetLuaState(), "g_vocab_level = ox.lua.CLua('test_vocab_level', false)"
                                                  " ox.lua.BindOX(g_vocab_level) return 'ok'"),
              "ok");
    ox::lua::CLua* level = ox::lua::CLua::GetLua("test_vocab_level");
    ASSERT_NE(level, nullptr);
    EXPECT_EQ(Walk(*level, "level").found, 0);
    oxtest::RunChunk(lua.GetLuaState(), "__QEBindGame(g_vocab_level)");
    // ... and qe.StartLevel gives it the mini-games through the game's level binder.
    qe::SetLevelBinder([main = &lua](ox::lua::CLua& host) {
        host.BeginBinding();
        host.Bind(kminigames::BindMiniGames(main));
        host.EndBinding();
    });
    oxtest::TempDir dir;
    oxtest::ScopedCwd cwd {dir.Path()};
    dir.Write("scripts/game_engine/quest.lua", "quest = { StartLevel = function() return 1 end }");
    EXPECT_EQ(qe::StartLevel(level, nullptr, nullptr, "", nullptr, "", u"", "", false), 1);
    EXPECT_EQ(oxtest::RunChunk(level->GetLuaState(), "return kminigames.g_MainLua.GetId().c_str()"),
              "test_vocab_main");
    qe::SetLevelBinder(nullptr);
    for (const char* group : {"level", "achievements", "window_effects", "minigames"}) {
        oxtest::GroupResult result = Walk(*level, group);
        EXPECT_EQ(result.problems, "") << group;
        EXPECT_EQ(result.found, result.wanted) << group;
    }
    // The options class of a level has its constants and no methods; records stay in main.
    EXPECT_EQ(oxtest::RunChunk(level->GetLuaState(), "return tostring(k17.CGameOptions.Save) .. tostring(k17.g_RecordTable)"),
              "nilnil");

    EXPECT_TRUE(boxes.Boxes().empty()) << boxes.Boxes().front().text;
}

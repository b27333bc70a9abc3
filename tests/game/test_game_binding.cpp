// The game shell's script names: a script creates a profile, changes and saves options,
// enters a record and walks the table; __QEBindGame gives a level's state its share.
#include "game/GameBinding.h"
#include "game/GameOptions.h"
#include "game/Profile.h"
#include "game/RecordTable.h"
#include "lua/Lua.h"
#include "lua/LuaTestHost.h"
#include "misc/Unicode.h"
#include "quest/QuestBinding.h"
#include "support/TestSupport.h"

using namespace k17;

TEST(GameBinding, ScriptsReachProfilesOptionsAndRecords)
{
    oxtest::TempDir dir;
    oxtest::MessageCapture boxes;
    const ox::wstring folder = ox::misc::Utf8ToWide(dir.Path().string());
    CGameOptions& options = g_GameOptions::Instance();
    options.SetFolder(folder);
    options.Load();
    CProfileManager& profiles = g_ProfileManager::Instance();
    profiles.SetSavesFolder(folder);
    profiles.Load();
    CRecordTable& records = g_RecordTable::Instance();
    records.SetFolder(folder);
    records.Load();

    ox::lua::CLua lua("test_game_main", false);
    qe::BindFramework(lua);
    lua.BeginBinding();
    lua.Bind(BindGameClasses());
    lua.Bind(BindGameGlobals());
    lua.EndBinding();
    EXPECT_EQ(oxtest::RunChunk(lua.GetLuaState(), R"(
        local pm = k17.g_ProfileManager.Instance()
        local ann = pm.CreateProfile('Ann', true)
        ann.SetGameGUID(k17.misc.CreateGUIDString())
        ann.SetStepType(k17.CProfile.GameStepTypeLevel)
        ann.SetLevelState(k17.LevelStateTypeFinished)
        pm.Save()
        local o = k17.g_GameOptions.Instance()
        o.SetMusicVolume(42.5)
        o.SetDificultyLevel(k17.CGameOptions.DificultyLevelHard)
        local mode = o.GetScreenMode()
        mode.Width = 800
        o.SetScreenMode(mode)
        o.UpdateLocalSettings()
        o.Save()
        local rt = k17.g_RecordTable.Instance()
        local place = rt.AddRecord(pm.GetCurrentProfile(), 77)
        rt.Save()
        local it, rows = rt.GetRecords(), 0
        local first = it.Get().Name.c_str() .. '=' .. it.Get().Score
        while not it.IsEnd() do rows = rows + 1 it.Next() end
        g_level = ox.lua.CLua('test_game_level', false)
        __QEBindGame(g_level)
        return table.concat({place, first, rows, tostring(pm.GetProfile('Ann') ~= nil), tostring(pm.GetProfile(1) == nil),
                             tostring(pm.CompareWithoutCase('ann', 'ANN')), o.GetScreenMode().Width}, ' ')
    )"),
              "1 Ann=77 10 true true true 800");
    EXPECT_TRUE(boxes.Boxes().empty()) << boxes.Boxes().front().text;
    ASSERT_NE(profiles.GetCurrentProfile(), nullptr);
    EXPECT_EQ(profiles.GetCurrentProfile()->GetLevelState(), LevelStateTypeFinished);
    EXPECT_NE(oxtest::ReadFile(dir / "options.xml").find("value=\"42.500\""), std::string::npos);
    EXPECT_NE(oxtest::ReadFile(dir / "records.xml").find("name=\"Ann\" score=\"77\""), std::string::npos);

    ox::lua::CLua* level = ox::lua::CLua::GetLua("test_game_level");
    ASSERT_NE(level, nullptr);
    EXPECT_EQ(oxtest::RunChunk(level->GetLuaState(), R"(
        k17.SetDificultyLevel(0)
        return table.concat({k17.GetMusicVolume(), k17.GetSoundVolume(), k17.GetDificultyLevel(),
                             k17.CGameOptions.DificultyLevelHard, tostring(k17.CGameOptions.Save == nil),
                             k17.g_ProfileManager.Instance().GetCurrentProfile().GetName().c_str(),
                             tostring(k17.g_RecordTable == nil)}, ' ')
    )"),
              "42 100 0 1 true Ann true");
    EXPECT_EQ(options.GetDificultyLevel(), 0);
    // Twice into one state: the classes stay as they are.
    BindGameInto(level);
    BindGameInto(&lua);
    EXPECT_EQ(oxtest::RunChunk(lua.GetLuaState(), "return tostring(k17.g_GameOptions.Instance().Save ~= nil)"), "true");
    EXPECT_TRUE(boxes.Boxes().empty()) << boxes.Boxes().front().text;
    profiles.DeleteProfile(u"Ann");
}

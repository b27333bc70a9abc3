// The demo's scripts/profiles.lua and records.lua against the real game vocabulary, their
// windows and level replaced by recorders: the chooser makes and switches players, F ends the
// level and the records window shows the new entry, and each switch and close saves the level.
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

namespace {

// What main.lua and the demo's native helpers give profiles.lua, as recorders.
const char* const kStage = R"(
    log = {}
    local function note(text) table.insert(log, text) end
    quest = { OnClose = function() note('base close') return true end }
    DemoWindow = { OnKeyDown = function() note('base key') return true end }
    Run = function() note('base run') end
    local level = { get = function() return nil end }
    lantern = { level = level }
    StartLevel = function() note('level built') lantern.level = level end
    texts = {}
    players = { lines = {}, selected = -1 }
    players.GetId = function() return 'players' end
    players.ClearLines = function() players.lines = {} end
    players.AddLine = function(text) table.insert(players.lines, text) end
    players.SelectLine = function(index) players.selected = index end
    players.GetSelectedLine = function() return players.selected end
    players.GetLine = function(index) return players.lines[index + 1] end
    local function window(id)
        return { id = id,
                 GetWidget = function(name)
                     if name == 'players' then return players end
                     if name ~= 'records_table' then return name end
                 end,
                 GetParentWindow = function() return { RemoveChildWindow = function() note('closed ' .. id) end } end }
    end
    demo = {
        OpenWindow = function(id) note('open ' .. id) last_window = window(id) return last_window end,
        SetText = function(widget, text) texts[widget] = text end,
        SaveLevelState = function(level, path) note('save') return true end,
        RestoreLevelState = function(level, path) note('restore') return false end,
    }
    function press(id) return ProfilesWnd.OnChildAction(last_window, 'pressed', { GetId = function() return id end }) end
)";

} // namespace

TEST(DemoProfilesScript, ChooserPlayersRecordsAndSaves)
{
    oxtest::TempDir dir;
    oxtest::MessageCapture boxes;
    const ox::wstring folder = ox::misc::Utf8ToWide(dir.Path().string());
    CProfileManager& profiles = g_ProfileManager::Instance();
    profiles.SetSavesFolder(folder);
    profiles.Load();
    CRecordTable& records = g_RecordTable::Instance();
    records.SetFolder(folder);
    records.Load();

    ox::lua::CLua lua("test_demo_profiles", false);
    qe::BindFramework(lua);
    lua.BeginBinding();
    lua.Bind(BindGameClasses());
    lua.Bind(qe::BindQuestClasses());
    lua.EndBinding();
    lua_State* L = lua.GetLuaState();
    ASSERT_EQ(oxtest::RunChunk(L, kStage), "nil");
    for (const char* script : {"profiles.lua", "records.lua"})
        ASSERT_EQ(oxtest::RunChunk(L, oxtest::ReadFile(std::filesystem::path(OX_DEMO_GAME) / "scripts" / script)), "nil");

    EXPECT_EQ(oxtest::RunChunk(L, R"(
        Run()
        DemoWindow.OnKeyDown(nil, 80, 0, 0, false)
        local a = texts.current
        press('new_profile')
        press('new_profile')
        local b = texts.current .. '|' .. table.concat(players.lines, '|') .. '|' .. players.selected
        players.SelectLine(0)
        ProfilesWnd.OnChildAction(last_window, 'line_selected', players)
        local c = texts.current
        DemoWindow.OnKeyDown(nil, 70, 0, 0, false)
        local d = texts.place1 .. ' ' .. texts.name1 .. ' ' .. (texts.score1:gsub('%d+$', 'N'))
        DemoWindow.OnKeyDown(nil, 32, 0, 0, false)
        quest.OnClose()
        return table.concat({a, b, c, d}, '/') .. '\n' .. table.concat(log, ', ')
    )"),
              "Nobody plays yet: add a new player/Playing: Player 2|Player 1|Player 2|1/Playing: Player 1/"
              "1. Player 1 N\n"
              "base run, open profiles, level built, save, level built, save, level built, restore, save, "
              "open records, base key, save, base close");
    EXPECT_TRUE(boxes.Boxes().empty()) << boxes.Boxes().front().text;
    ASSERT_EQ(profiles.EnumProfiles(), 2u);
    EXPECT_EQ(profiles.GetCurrentProfile()->GetName(), u"Player 1");
    EXPECT_EQ(profiles.GetCurrentProfile()->GetLevelState(), LevelStateTypeFinished);
    EXPECT_EQ(records.Records().front().Name, u"Player 1");
    EXPECT_GE(records.Records().front().Score, 990);
    EXPECT_NE(oxtest::ReadFile(dir / "records.xml").find("name=\"Player 1\""), std::string::npos);
    EXPECT_NE(oxtest::ReadFile(dir / "saves.xml").find("current_profile_name=\"Player 1\""), std::string::npos);
    profiles.DeleteProfile(u"Player 1");
    profiles.DeleteProfile(u"Player 2");
}

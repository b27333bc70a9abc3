// The mini-game widget with a script host: events reach the group's functions with their
// arguments in the widget's coordinates, an untaken event goes on to the base, and the game's
// result reaches the parent.
#include "game/MiniGameWidget.h"
#include "lua/Lua.h"
#include "lua/LuaTestHost.h"
#include "quest/QuestBinding.h"
#include "support/TestSupport.h"

#include <gtest/gtest.h>

using namespace ox;
using kminigames::CMiniGameWidget;

namespace {

struct Parent : gui::CWidget {
    std::string action;
    float result = -1;
    void OnChildAction(const std::string& a, gui::CWidget* sender) override
    {
        action = a;
        result = static_cast<CMiniGameWidget*>(sender)->GetGameResult();
    }
};

} // namespace

TEST(MiniGame, EventsReachTheGroupsFunctionsAndTheResultTheParent)
{
    lua::CLua lua("test_minigame", false);
    qe::BindFramework(lua);
    lua.BeginBinding();
    lua.Bind(kminigames::BindMiniGames(&lua));
    lua.EndBinding();
    ASSERT_EQ(oxtest::RunChunk(lua.GetLuaState(), R"(
        log = {}
        function loaded(w) log[#log + 1] = "loaded" end
        g = {}
        function g.down(w, pos, button, keys, broadcast)
            log[#log + 1] = string.format("down %d,%d b%d k%d %s", pos.X, pos.Y, button, keys, tostring(broadcast))
            return true
        end
        function g.key(w, key, keys, raw, broadcast)
            log[#log + 1] = "key " .. key
            return false
        end
        function g.update(w)
            log[#log + 1] = "update"
            if #log > 3 then w.SetGameResult(7.5) w.OnEndGame() end
        end
        function g.size(w) return ox.misc.FloatVector(10, 300) end
    )"), "nil");

    boost::intrusive_ptr<Parent> parent(new Parent());
    boost::intrusive_ptr<CMiniGameWidget> game(new CMiniGameWidget());
    parent->AddWidget(game);
    // Without a host it is a plain widget.
    game->SetScriptName(CMiniGameWidget::ScriptMouseDown, "down");
    EXPECT_FALSE(game->OnMouseDown({1, 1}, gui::LeftButton, 0, false));

    game->SetOnLoadScriptName("loaded", "test_minigame");
    game->SetScriptName(CMiniGameWidget::ScriptGroup, "g.");
    game->SetScriptName(CMiniGameWidget::ScriptKeyDown, "key");
    game->SetScriptName(CMiniGameWidget::ScriptUpdate, "update");
    game->SetScriptName(CMiniGameWidget::ScriptPreferredSize, "size");
    EXPECT_TRUE(game->OnMouseDown({12, 34}, gui::RightButton, 2, false));
    EXPECT_FALSE(game->OnKeyDown('A', 0, 0, false));
    game->Update();
    game->Update();
    EXPECT_EQ(oxtest::RunChunk(lua.GetLuaState(), R"(
        assert(table.concat(log, "|") == "loaded|down 12,34 b1 k2 false|key 65|update|update", table.concat(log, "|"))
    )"), "nil");
    EXPECT_EQ(parent->action, "end_game");
    EXPECT_FLOAT_EQ(parent->result, 7.5f);
    // A script's size counts only where it is larger.
    game->SetSize(50, 50);
    EXPECT_EQ(game->GetPreferredSize(), misc::FloatVector(10, 300));
}

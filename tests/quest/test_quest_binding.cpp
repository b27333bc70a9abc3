// The quest tree from Lua: building a scene with the bound classes, walking its lists, and
// the reference counts of objects a script holds while the tree lets them go.
#include "gui/GuiBinding.h"
#include "lua/LuaTestHost.h"
#include "lua/mluabind/StdBinding.h"
#include "quest/Area.h"
#include "quest/ImageObject.h"
#include "quest/Level.h"
#include "core/Settings.h"
#include "quest/LuaThreadManager.h"
#include "quest/QuestBinding.h"
#include "quest/QuestData.h"
#include "quest/SceneGroup.h"
#include "support/TestSupport.h"

using namespace qe;

namespace {

// An image that counts the living ones.
struct CountedImage : CImageObject {
    static inline int Alive = 0;
    CountedImage() { ++Alive; }
    ~CountedImage() override { --Alive; }
};

LevelPtrT g_Level;

struct QuestBinding : ::testing::Test {
    oxtest::LuaTestHost host;

    void SetUp() override
    {
        host.Declare([] { return mluabind::BindStdStrings(); });
        // Quest widgets derive from the GUI's.
        host.Declare([] { return mluabind::Namespace("ox").Merge(ox::gui::BindGui()); });
        host.Declare([] { return BindQuestClasses(); });
        host.Declare([] {
            mluabind::Namespace test("test");
            test.AddFunction(mluabind::Function("Level", [] { return g_Level.get(); }));
            test.AddFunction(mluabind::Function("Alive", [] { return CountedImage::Alive; }));
            return test;
        });
        g_Level.reset(new CLevel());
        ScenePtrT scene(new CScene());
        scene->SetId("main");
        g_Level->InsertScene(scene, nullptr);
        for (const char* id : {"key", "lamp"}) {
            BaseSceneObjectPtrT image(new CountedImage());
            image->SetId(id);
            scene->InsertObject(image, scene->Objects().empty() ? nullptr : scene->Objects().back().get());
        }
        scene->UpdateTotalChildList();
    }
    void TearDown() override { g_Level.reset(); }
    void Collect() { lua_gc(host.GetLuaState(), LUA_GCCOLLECT, 0); }
};

} // namespace

TEST_F(QuestBinding, ScriptsBuildAndWalkTheTree)
{
    EXPECT_EQ(host.Run(R"(
        local scene = test.Level().GetSceneById('main')
        local group = qe.CSceneGroup()
        group.SetId('drawer')
        for _, id in ipairs({'closed', 'open'}) do
            local state = qe.CImageObject()
            state.SetId(id)
            group.InsertChild(qe.CBaseSceneObjectPtrT(state), nil)
        end
        scene.InsertObject(qe.CBaseSceneObjectPtrT(group), nil)
        scene.UpdateTotalChildList()
        local ids = {}
        local it = scene.GetChilds()
        while not it.IsEnd() do
            table.insert(ids, it.Get().GetId().c_str())
            it.Next()
        end
        return table.concat(ids, ' '))"),
              "open closed key lamp");
    EXPECT_TRUE(host.Reports.empty()) << host.LastReport();

    EXPECT_EQ(host.Run(R"(
        local level = test.Level()
        local found = level.FindObjectById('open', true, false)
        found.RaiseObjectFlag(qe.CBaseSceneObject.ObjectFlagHidden)
        return tostring(found.GetParentGroup().GetFirstVisibleState().c_str()) .. ' ' ..
               level.GetSceneById('main').EnumObjects() .. ' ' .. qe.CScene.FlagSceneInNewWindow .. ' ' ..
               qe.CLevel.ScriptStart .. ' ' .. found.GetType())"),
              "closed 3 2 1 1");
    EXPECT_TRUE(host.Reports.empty()) << host.LastReport();
}

TEST_F(QuestBinding, AnObjectHeldFromLuaOutlivesItsRemoval)
{
    CBaseSceneObject* key = g_Level->FindObjectById("key", false, false);
    ASSERT_NE(key, nullptr);
    EXPECT_EQ(key->GetRefCount(), 2) << "the scene's list and its flat list";
    EXPECT_EQ(host.Run("held = qe.CBaseSceneObjectPtrT(test.Level().FindObjectById('key', false, false)) "
                       "return held.GetId().c_str()"),
              "key");
    Collect();
    EXPECT_EQ(key->GetRefCount(), 3);

    g_Level->RemoveObject("key");
    Collect();
    EXPECT_EQ(key->GetRefCount(), 1) << "only the script holds it now";
    EXPECT_EQ(CountedImage::Alive, 2);
    EXPECT_EQ(host.Run("return held.GetId().c_str() .. ' ' .. tostring(test.Level().FindObjectById('key', false, true))"),
              "key nil");

    // A copy of the pointer counts too; the last one to go takes the object.
    EXPECT_EQ(host.Run("second = qe.CBaseSceneObjectPtrT(held.get()) held = nil"), "nil");
    Collect();
    EXPECT_EQ(key->GetRefCount(), 1);
    EXPECT_EQ(host.Run("second = nil"), "nil");
    Collect();
    EXPECT_EQ(CountedImage::Alive, 1);
    EXPECT_TRUE(host.Reports.empty()) << host.LastReport();
}

TEST_F(QuestBinding, ScriptsReachTheQuestDataAndTheThreadManager)
{
    const std::string xml = "<?xml version='1.0'?><Quest><level id='l'><scene id='s'/></level></Quest>";
    ox::core::CSettings settings;
    ASSERT_TRUE(settings.LoadXmlFromMemory(xml.data(), xml.size(), "quest.xml"));
    g_QuestData::Instance().SetBlock(dump::Compile(settings.GetChild("Quest"), "quest.xml"));
    EXPECT_EQ(host.Run("local l = qe.CLevelPtrT(qe.g_QuestData.Instance().CreateLevel('l')) "
                       "return l.GetSceneById('s').GetId().c_str()"),
              "s");
    EXPECT_EQ(host.Run("return qe.g_QuestData.Instance().CreateLevel('none')"), "nil");
    EXPECT_EQ(host.Run("return qe.g_LuaThreadManager.Instance().GetElapsedTime()"), "0");
    g_QuestData::Instance().SetBlock({});
    EXPECT_TRUE(host.Reports.empty()) << host.LastReport();
}

TEST_F(QuestBinding, TheInventoryCursorAndSceneWidgetNamesAndTheTextHelpers)
{
    EXPECT_EQ(host.Run(R"(
        local names = {}
        for _, path in ipairs({'CSceneWidget.ClearScriptCache', 'g_Cursor.Instance', 'g_QuestData.Instance',
                               'g_LuaThreadManager.Instance', 'FindObjectInventCondition', 'FindObjectCursorInventState',
                               'OnClose', 'LoadSceneChild_', 'StringFormat', 'ReplaceDollarByS'}) do
            local value = qe
            for part in path:gmatch('[^.]+') do value = value and value[part] end
            if value == nil then table.insert(names, path) end
        end
        for _, class in ipairs({'CObjectsBox', 'BoxItem', 'CSceneWidget', 'CObjectsBoxWidget', 'CCursor',
                                'CObjectsBoxPtrT', 'CSceneWidgetPtrT', 'CObjectsBoxWidgetPtrT', 'CCursorPtrT',
                                'CSceneObjectPtrT'}) do
            if qe[class] == nil then table.insert(names, class) end
        end
        return 'missing: ' .. table.concat(names, ' '))"),
              "missing: ");
    EXPECT_EQ(host.Run("local box = qe.CObjectsBox() "
                       "local key = qe.CImageObject() key.SetId('key') "
                       "box.InsertObject(qe.CBaseSceneObjectPtrT(key), nil) "
                       "local cursor = qe.g_Cursor.Instance() cursor.SetCursorObject(key) "
                       "local drawn = cursor.GetCursorObject().GetId().c_str() cursor.ClearCursor(true) "
                       "return drawn .. ' ' .. box.GetObject(0).InventState.GetId().c_str() .. ' ' .. "
                       "tostring(box.FindObjectInBox('key')) .. ' ' .. tostring(box.GetObject(1))"),
              "key key true nil");
    EXPECT_EQ(host.Run("return qe.StringFormat(std.wstring('%d of %d'), 3, 9).c_str() .. ' ' .. "
                       "qe.StringFormat(std.wstring('<%s>'), std.wstring('gem')).c_str() .. ' ' .. "
                       "qe.ReplaceDollarByS(std.wstring('$1$')).c_str()"),
              "3 of 9 <gem> S1S");
    EXPECT_TRUE(host.Reports.empty()) << host.LastReport();
}

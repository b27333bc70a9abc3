// The quest tree: the editing rules of its lists, the flat list of a scene, the searches of
// a level, focus and hints, the level's and scenes' scripts, copies and group cycles.
#include "lua/Lua.h"
#include "lua/LuaTestHost.h"
#include "lua/mluabind/StdBinding.h"
#include "quest/Area.h"
#include "quest/Level.h"
#include "quest/Quest.h"
#include "quest/QuestServices.h"
#include "quest/SceneGroup.h"
#include "support/TestSupport.h"

using namespace qe;

namespace {

BaseSceneObjectPtrT Object(const std::string& id, uint32_t flags = 0)
{
    BaseSceneObjectPtrT object(new CArea());
    object->SetId(id);
    object->SetObjectFlags(flags);
    return object;
}

SceneGroupPtrT Group(const std::string& id, std::initializer_list<BaseSceneObjectPtrT> states)
{
    SceneGroupPtrT group(new CSceneGroup());
    group->SetId(id);
    for (const BaseSceneObjectPtrT& state : states)
        group->InsertChild(state, group->Childs().empty() ? nullptr : group->Childs().back().get());
    return group;
}

// The ids of a list, front first.
template <class List>
std::string Ids(const List& list)
{
    std::string ids;
    for (const auto& node : list)
        ids += (ids.empty() ? "" : " ") + node->GetId();
    return ids;
}

// Appends at the back: insertion behind the last element.
void Append(CScene& scene, BaseSceneObjectPtrT object)
{
    const CBaseSceneObject* last = scene.Objects().empty() ? nullptr : scene.Objects().back().get();
    scene.InsertObject(std::move(object), last);
}

// A level of two scenes: "a" holds b1, a group g (states s1, s2) and an area; "b" holds b1
// again (a second object with that id) and x.
struct QuestLevel : ::testing::Test {
    LevelPtrT level {new CLevel()};
    ScenePtrT a {new CScene()}, b {new CScene()};
    BaseSceneObjectPtrT b1 = Object("b1"), s1 = Object("s1"), s2 = Object("s2", CBaseSceneObject::ObjectFlagHidden);
    SceneGroupPtrT g = Group("g", {s1, s2});
    BaseSceneObjectPtrT area {new CArea()}, b1InB = Object("b1"), x = Object("x");

    void SetUp() override
    {
        a->SetId("a");
        b->SetId("b");
        area->SetId("area");
        Append(*a, b1);
        Append(*a, g);
        a->InsertArea(area, nullptr);
        Append(*b, b1InB);
        Append(*b, x);
        level->InsertScene(a, nullptr);
        level->InsertScene(b, a.get());
        a->UpdateTotalChildList();
        b->UpdateTotalChildList();
    }
    void TearDown() override { GetQuestServices() = QuestServices(); }
};

} // namespace

TEST(QuestTree, InsertionAndRemovalRules)
{
    CScene scene;
    BaseSceneObjectPtrT x = Object("x"), y = Object("y"), z = Object("z"), stranger = Object("stranger");
    scene.InsertObject(x, nullptr);
    scene.InsertObject(y, nullptr);
    EXPECT_EQ(Ids(scene.Objects()), "y x") << "null puts it on top";
    scene.InsertObject(z, y.get());
    EXPECT_EQ(Ids(scene.Objects()), "y z x") << "directly behind, one step lower";
    scene.InsertObject(Object("w"), stranger.get());
    EXPECT_EQ(Ids(scene.Objects()), "w y z x") << "behind an object that isn't there: on top";
    scene.InsertObject(nullptr, nullptr);
    EXPECT_EQ(scene.EnumObjects(), 4u) << "no null element";

    // Every occurrence goes; the last reference survives the walk and then goes too.
    scene.InsertObject(z, x.get());
    CBaseSceneObject* raw = z.get();
    z.reset();
    EXPECT_EQ(raw->GetRefCount(), 2);
    scene.RemoveObject(*raw);
    EXPECT_EQ(Ids(scene.Objects()), "w y x");
    scene.RemoveObject(*stranger);
    EXPECT_EQ(scene.EnumObjects(), 3u);

    // The same rules for levels, scenes, areas, states and points.
    CQuest quest;
    LevelPtrT one(new CLevel()), two(new CLevel());
    one->SetId("one");
    two->SetId("two");
    quest.InsertLevel(one, nullptr);
    quest.InsertLevel(two, one.get());
    EXPECT_EQ(Ids(quest.Levels()), "one two");
    EXPECT_EQ(quest.GetLevelById("two"), two.get());
    EXPECT_EQ(quest.GetLevelById("three"), nullptr);
    ScenePtrT scenePtr(new CScene());
    one->InsertScene(scenePtr, nullptr);
    EXPECT_EQ(scenePtr->GetParentLevel(), one.get());
    CArea area;
    AreaPointPtrT p1(new CAreaPoint({1, 1})), p2(new CAreaPoint({2, 2}));
    area.InsertPoint(p1, nullptr);
    area.InsertPoint(p2, nullptr);
    area.InsertPoint(AreaPointPtrT(new CAreaPoint({3, 3})), p2.get());
    EXPECT_EQ(area.Points()[1]->GetPos().X, 3) << "behind p2, which went first";
    area.RemovePoint(p2.get());
    EXPECT_EQ(area.EnumPoints(), 2u);
}

TEST_F(QuestLevel, FlatListAndContentSearches)
{
    EXPECT_EQ(Ids(a->Childs()), "b1 s1 s2") << "states in place of their group, no areas";
    EXPECT_EQ(s1->GetParentGroup(), g.get());
    // A group among the states brings its own states.
    SceneGroupPtrT inner = Group("inner", {Object("i1")});
    g->InsertChild(inner, nullptr);
    a->UpdateTotalChildList();
    EXPECT_EQ(Ids(a->Childs()), "b1 i1 s1 s2");

    // Back to front: the last in list order; states are not searched.
    Append(*a, Object("b1"));
    EXPECT_EQ(a->IsContentObject("b1"), a->Objects().back().get());
    EXPECT_EQ(a->IsContentObject("s1"), nullptr);
    EXPECT_EQ(a->IsContentArea("area"), area.get());
    EXPECT_EQ(a->IsContentArea("b1"), nullptr);
    EXPECT_EQ(level->GetSceneById("b"), b.get());
}

TEST_F(QuestLevel, FindObjectByIdWalksScenesObjectsStatesAndAreas)
{
    EXPECT_EQ(level->FindObjectById("b1", false, false), b1.get()) << "the first scene's first";
    EXPECT_EQ(level->FindObjectById("s2", false, false), nullptr);
    EXPECT_EQ(level->FindObjectById("s2", true, false), s2.get()) << "hidden states are found";
    EXPECT_EQ(level->FindObjectById("area", false, false), area.get());
    EXPECT_EQ(level->FindObjectById("x", false, false), x.get());

    b1->RaiseObjectFlag(CBaseSceneObject::ObjectFlagRemoved);
    EXPECT_EQ(level->FindObjectById("b1", false, false), b1InB.get()) << "removed ones are passed over";
    EXPECT_EQ(level->FindObjectById("b1", false, true), b1.get());
    g->RaiseObjectFlag(CBaseSceneObject::ObjectFlagRemoved);
    EXPECT_EQ(level->FindObjectById("s1", true, false), nullptr) << "with their states";
    s1->RaiseObjectFlag(CBaseSceneObject::ObjectFlagRemoved);
    g->ClearObjectFlag(CBaseSceneObject::ObjectFlagRemoved);
    EXPECT_EQ(level->FindObjectById("s1", true, false), s1.get()) << "states themselves are not filtered";
}

TEST_F(QuestLevel, RemoveObjectTakesTheLastMatchAndDropsTheFocus)
{
    level->RemoveObject("b1");
    EXPECT_EQ(Ids(b->Objects()), "x") << "the last match, in scene b";
    EXPECT_EQ(Ids(b->Childs()), "x") << "and b's flat list is rebuilt";
    EXPECT_EQ(Ids(a->Objects()), "b1 g");
    level->RemoveObject("s1");
    level->RemoveObject("area");
    EXPECT_EQ(g->EnumChilds(), 2u) << "states and areas stay";
    EXPECT_EQ(a->EnumAreas(), 1u);

    // The focus on a state of a group that goes is dropped without its leave script.
    std::vector<std::string> calls;
    GetQuestServices().runMouseScript = [&](CBaseSceneObject& o, int kind) {
        calls.push_back(o.GetIdRef() + (kind == CBaseSceneObject::ScriptMouseEnter ? " enter" : " leave"));
    };
    GetQuestServices().setHintText = [&](const std::string& hint) { calls.push_back("hint '" + hint + "'"); };
    s1->SetHint("the drawer");
    level->UpdateFocusedObject(s1.get());
    level->RemoveObject("g");
    EXPECT_EQ(level->GetFocusedObject(), nullptr);
    EXPECT_EQ(Ids(a->Childs()), "b1");
    EXPECT_EQ(calls, (std::vector<std::string> {"s1 enter", "hint 'the drawer'", "hint ''"}));
}

TEST_F(QuestLevel, FocusRunsScriptsMovesTheGameCursorAndShowsHints)
{
    oxtest::MessageCapture boxes;
    ox::lua::CLua lua("qe_level", false);
    lua.BeginBinding();
    lua.Bind(mluabind::BindStdStrings());
    lua.EndBinding();
    ASSERT_TRUE(lua.Run(std::string(
        "log = {} "
        "cursor_lua_widget = { SetGameCursor = function(id) table.insert(log, 'set ' .. id.c_str()) end, "
        "                      DropGameCursor = function() table.insert(log, 'drop') end }")));
    GetQuestServices().runMouseScript = [&](CBaseSceneObject& o, int kind) {
        lua.Run(std::string("table.insert(log, '") + o.GetIdRef() +
                (kind == CBaseSceneObject::ScriptMouseEnter ? " enter')" : " leave')"));
    };
    GetQuestServices().setHintText = [&](const std::string& hint) {
        lua.Run("table.insert(log, 'hint " + hint + "')");
    };
    g->SetHint("group hint");
    b1->SetHint("own hint");

    level->UpdateFocusedObject(s1.get());
    level->UpdateFocusedObject(s1.get());
    level->UpdateFocusedObject(b1.get());
    level->UpdateHint(s1.get());
    level->UpdateHint(b1.get());
    level->UpdateFocusedObject(nullptr);
    EXPECT_EQ(oxtest::RunChunk(lua.GetLuaState(), "return table.concat(log, ', ')"),
              "s1 enter, set g, hint group hint, "          // a state: the group's cursor and hint
              "s1 leave, b1 enter, set b1, hint own hint, "  // straight to another: no drop
              "hint own hint, "                              // only the focused object's hint
              "b1 leave, drop, hint ");
    EXPECT_TRUE(boxes.Boxes().empty());
}

TEST(QuestTree, LevelAndSceneScriptsRunInTheLevelHost)
{
    oxtest::MessageCapture boxes;
    ox::lua::CLua lua("qe_level", false);
    ASSERT_TRUE(lua.Run(std::string("quest = {} ran = ''")));
    CLevel level;
    level.SetLuaScript("ran = ran .. 'level;'", CLevel::ScriptLevel);
    level.SetLuaScript("ran = ran .. 'start;'", CLevel::ScriptStart);
    level.SetLuaScript("ignored", 7);
    EXPECT_EQ(level.GetLuaScript(7), "");
    level.RunLevelScript();
    level.RunStartLevelScript();
    EXPECT_EQ(oxtest::RunChunk(lua.GetLuaState(), "return ran"), "level;start;");
    ASSERT_TRUE(lua.Run(std::string("quest.on_box_take()")));
    EXPECT_EQ(oxtest::RunChunk(lua.GetLuaState(), "return ran"), "level;start;start;")
        << "both use one function name, and the last run keeps it";

    // An empty script defines nothing; a broken one is reported and leaves the old function.
    CLevel empty;
    empty.RunLevelScript();
    level.SetLuaScript("ran = (", CLevel::ScriptLevel);
    level.RunLevelScript();
    EXPECT_EQ(boxes.Boxes().size(), 1u);
    ASSERT_TRUE(lua.Run(std::string("quest.on_box_take()")));
    EXPECT_EQ(oxtest::RunChunk(lua.GetLuaState(), "return ran"), "level;start;start;start;");
}

TEST(QuestTree, ScriptsWithoutALevelHostAreLogged)
{
    oxtest::LogCapture log;
    CScene scene;
    scene.SetScript("x = 1");
    scene.RunSceneScript();
    EXPECT_TRUE(log.Contains("No Lua host 'qe_level' to run quest.on_show_scene in"));
}

TEST_F(QuestLevel, CloneIsDeepAndLinkedToTheCopy)
{
    level->SetId("level1");
    level->SetSound("box.ogg", CLevel::SoundMovingToABox);
    level->SetShowChildSceneAreas(false);
    a->SetSize({1024, 600});
    a->SetFlags(CScene::FlagMainScene);
    s1->SetLuaScript("take(self)", CBaseSceneObject::ScriptMouseClick);
    LevelPtrT copy = level->Clone();
    ASSERT_EQ(copy->EnumScenes(), 2u);
    CScene* copyA = copy->GetSceneById("a");
    ASSERT_NE(copyA, nullptr);
    EXPECT_EQ(copyA->GetParentLevel(), copy.get());
    EXPECT_EQ(copy->GetSound(CLevel::SoundMovingToABox), "box.ogg");
    EXPECT_FALSE(copy->GetShowChildSceneAreas());
    EXPECT_EQ(copyA->GetSize().X, 1024);
    EXPECT_EQ(copyA->GetFlags(), CScene::FlagMainScene);
    EXPECT_EQ(Ids(copyA->Objects()), "b1 g");
    EXPECT_EQ(Ids(copyA->Childs()), "b1 s1 s2");
    EXPECT_EQ(Ids(copyA->Areas()), "area");

    CBaseSceneObject* copyS1 = copy->FindObjectById("s1", true, false);
    ASSERT_NE(copyS1, nullptr);
    EXPECT_NE(copyS1, s1.get());
    EXPECT_EQ(copyS1->GetLuaScript(CBaseSceneObject::ScriptMouseClick), "take(self)");
    EXPECT_EQ(copyS1->GetParentGroup(), copy->FindObjectById("g", false, false));
    EXPECT_TRUE(copy->FindObjectById("s2", true, false)->ReadObjectFlag(CBaseSceneObject::ObjectFlagHidden));
}

TEST(QuestTree, GroupCyclesAreRefusedWithALogLine)
{
    oxtest::LogCapture log;
    SceneGroupPtrT outer = Group("outer", {}), inner = Group("inner", {Object("leaf")});
    ASSERT_TRUE(outer->InsertChild(inner, nullptr));
    EXPECT_FALSE(outer->InsertChild(outer, nullptr));
    EXPECT_FALSE(inner->InsertChild(outer, nullptr)) << "a group holding the target";
    EXPECT_TRUE(log.Contains("Group 'inner' can't take 'outer' as a state: the group lies inside it"));
    EXPECT_EQ(inner->EnumChilds(), 1u);
    EXPECT_EQ(outer->GetParentGroup(), nullptr);
    EXPECT_FALSE(outer->SetParentGroup(inner.get()));
    EXPECT_TRUE(log.Contains("Object 'outer' can't become a state of group 'inner', which lies inside it"));

    // Walks over the tree still end: the flat list of a scene with the nested groups.
    CScene scene;
    scene.InsertObject(outer, nullptr);
    scene.UpdateTotalChildList();
    EXPECT_EQ(Ids(scene.Childs()), "leaf");

    // A state held elsewhere loses its link when the group goes.
    BaseSceneObjectPtrT leaf = inner->GetStateById("leaf");
    scene.RemoveObject(*outer);
    outer.reset();
    EXPECT_EQ(leaf->GetParentGroup(), inner.get());
    inner.reset();
    EXPECT_EQ(leaf->GetParentGroup(), nullptr);
}

TEST_F(QuestLevel, WalksAfterMovingObjectsBetweenScenes)
{
    // Plain objects are hit inside their rectangles.
    auto place = [](CBaseSceneObject& o, FloatVector pos) {
        o.SetPos(pos);
        o.SetSize({20, 20});
    };
    BaseSceneObjectPtrT vase(new CObject());
    vase->SetId("vase");
    place(*vase, {200, 200});
    Append(*a, vase);
    a->UpdateTotalChildList();
    level->UpdateFocusedObject(vase.get());
    EXPECT_EQ(a->GetObjectAt({200, 200}, nullptr), vase.get());

    // To scene b, on top.
    a->RemoveObject(*vase);
    b->InsertObject(vase, nullptr);
    a->UpdateTotalChildList();
    b->UpdateTotalChildList();
    EXPECT_EQ(a->GetObjectAt({200, 200}, nullptr), nullptr);
    EXPECT_EQ(b->GetObjectAt({200, 200}, nullptr), vase.get());
    EXPECT_EQ(a->IsContentObject("vase"), nullptr);
    EXPECT_EQ(b->IsContentObject("vase"), vase.get());
    EXPECT_EQ(level->FindObjectById("vase", false, false), vase.get());
    EXPECT_EQ(Ids(b->Childs()), "vase b1 x");

    // A state moved from a group of a to a group of b takes the flags of its new group.
    BaseSceneObjectPtrT cup(new CObject());
    cup->SetId("cup");
    place(*cup, {50, 50});
    g->InsertChild(cup, nullptr);
    a->UpdateTotalChildList();
    EXPECT_EQ(a->GetObjectAt({50, 50}, nullptr), cup.get());
    SceneGroupPtrT shelf(new CSceneGroup());
    shelf->SetId("shelf");
    Append(*b, shelf);
    g->RemoveChild(*cup);
    EXPECT_EQ(cup->GetParentGroup(), nullptr);
    shelf->InsertChild(cup, nullptr);
    shelf->RaiseObjectFlag(CBaseSceneObject::ObjectFlagHidden);
    a->UpdateTotalChildList();
    b->UpdateTotalChildList();
    EXPECT_EQ(Ids(a->Childs()), "b1 s1 s2");
    EXPECT_EQ(Ids(b->Childs()), "vase b1 x cup");
    EXPECT_EQ(a->GetObjectAt({50, 50}, nullptr), nullptr);
    EXPECT_EQ(b->GetObjectAt({50, 50}, nullptr), nullptr) << "its new group is hidden";
    shelf->ClearObjectFlag(CBaseSceneObject::ObjectFlagHidden);
    EXPECT_EQ(b->GetObjectAt({50, 50}, nullptr), cup.get());
    EXPECT_EQ(level->FindObjectById("cup", true, false), cup.get());

    // The focus went along; taking the object out of the level drops it.
    EXPECT_EQ(level->GetFocusedObject(), vase.get());
    level->RemoveObject("vase");
    EXPECT_EQ(level->GetFocusedObject(), nullptr);
    EXPECT_EQ(Ids(b->Childs()), "b1 x cup");
    EXPECT_EQ(vase->GetRefCount(), 1) << "only the test holds it";
}

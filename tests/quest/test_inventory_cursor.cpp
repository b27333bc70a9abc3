// The objects box and the game cursor: the states a group shows in the box and on the
// cursor, the order of items, advancing states, and what the cursor draws at the pointer.
#include "graphics/Font.h"
#include "gui/Cursor.h"
#include "quest/GameCursor.h"
#include "quest/ImageObject.h"
#include "quest/ObjectsBox.h"
#include "quest/Scene.h"
#include "quest/SceneGroup.h"
#include "support/RecordingBackend.h"
#include "support/TestSupport.h"

#include <cstring>

using namespace qe;
using B = CBaseSceneObject;

namespace {

ImageObjectPtrT State(const char* id, bool hidden = false)
{
    ImageObjectPtrT image(new CImageObject());
    image->SetId(id);
    if (hidden)
        image->RaiseObjectFlag(B::ObjectFlagHidden);
    return image;
}

// A group with the states in order.
SceneGroupPtrT Group(const char* id, std::initializer_list<ImageObjectPtrT> states)
{
    SceneGroupPtrT group(new CSceneGroup());
    group->SetId(id);
    const CBaseSceneObject* last = nullptr;
    for (const ImageObjectPtrT& state : states) {
        group->InsertChild(state, last);
        last = state.get();
    }
    return group;
}

std::string Id(const CBaseSceneObject* object) { return object ? object->GetIdRef() : "null"; }

std::string Items(const CObjectsBox& box)
{
    std::string text;
    for (const BoxItem& item : box.Objects())
        text += (text.empty() ? "" : " ") + Id(item.Item.get()) + ":" + Id(item.InventState.get());
    return text;
}

} // namespace

TEST(ObjectsBox, BoxAndCursorChooseAGroupsStateInOppositeOrders)
{
    SceneGroupPtrT both = Group("both", {State("a"), State("__cur"), State("__inv")});
    SceneGroupPtrT curOnly = Group("cur", {State("a"), State("__cur")});
    SceneGroupPtrT hidden = Group("hidden", {State("a", true), State("b", true)});
    SceneGroupPtrT visible = Group("visible", {State("a", true), State("b")});
    SceneGroupPtrT empty = Group("empty", {});
    ImageObjectPtrT plain = State("plain");

    EXPECT_EQ(Id(FindObjectInventCondition(both.get())), "__inv");
    EXPECT_EQ(Id(FindObjectInventCondition(curOnly.get())), "__cur");
    EXPECT_EQ(Id(FindObjectInventCondition(hidden.get())), "a") << "all hidden: the first";
    EXPECT_EQ(Id(FindObjectInventCondition(visible.get())), "b");
    EXPECT_EQ(Id(FindObjectInventCondition(empty.get())), "null");
    EXPECT_EQ(Id(FindObjectInventCondition(plain.get())), "plain");
    EXPECT_EQ(Id(FindObjectCursorInventState(both.get())), "__cur");
    EXPECT_EQ(Id(FindObjectCursorInventState(visible.get())), "null");
    EXPECT_EQ(Id(FindObjectCursorInventState(plain.get())), "null");

    CCursor cursor;
    cursor.SetCursorObject(both.get());
    EXPECT_EQ(Id(cursor.GetDrawObject()), "__cur") << "whatever the group's current state";
    cursor.SetCursorObject(Group("inv", {State("a"), State("__inv")}).get());
    EXPECT_EQ(Id(cursor.GetDrawObject()), "__inv");
    cursor.SetCursorObject(empty.get());
    EXPECT_EQ(Id(cursor.GetDrawObject()), "__inv") << "an empty group keeps the drawn state";
    EXPECT_EQ(Id(cursor.GetCursorObject()), "empty");
    cursor.SetCursorObject(plain.get());
    EXPECT_EQ(Id(cursor.GetDrawObject()), "plain");
}

TEST(ObjectsBox, ItemsKeepTheirOrderAndAdvanceTheirStates)
{
    CObjectsBox box;
    ImageObjectPtrT key = State("key");
    SceneGroupPtrT jar = Group("jar", {State("full"), State("half", true), State("empty", true)});
    box.InsertObject(key, nullptr);
    box.InsertObject(jar, key.get());
    box.InsertObject(State("coin"), nullptr);
    EXPECT_EQ(Items(box), "coin:coin key:key jar:full");
    EXPECT_EQ(box.GetObject(box.EnumObjects()), nullptr);
    EXPECT_EQ(Id(box.GetObject(2)->Item.get()), "jar");
    EXPECT_TRUE(box.FindObjectInBox("jar"));
    EXPECT_FALSE(box.FindObjectInBox("full")) << "states are not items";

    // Two items of one id advance together; the last state stays.
    box.InsertObject(jar, nullptr);
    box.SetItemNextState("jar");
    EXPECT_EQ(Items(box), "jar:half coin:coin key:key jar:half");
    EXPECT_TRUE(jar->IsCurrent("half"));
    box.SetItemNextState("jar");
    box.SetItemNextState("jar");
    EXPECT_EQ(Items(box), "jar:empty coin:coin key:key jar:empty");
    box.SetItemStateById("jar", "full");
    box.SetItemStateById("jar", "none");
    box.SetItemNextState("key");
    EXPECT_EQ(Items(box), "jar:full coin:coin key:key jar:full");

    // The box keeps an object alive after its scene lets it go; both items leave together.
    ScenePtrT scene(new CScene());
    scene->InsertObject(jar, nullptr);
    scene->RemoveObject(*jar);
    CSceneGroup* raw = jar.get();
    jar.reset();
    EXPECT_EQ(raw->EnumChilds(), 3u);
    box.RemoveObject("jar");
    EXPECT_EQ(Items(box), "coin:coin key:key");
}

namespace {

const char* kFontXml = R"(<?xml version="1.0"?>
<Font Padding="0 0 0 0" Space="5" PixHeight="20" Baseline="6" SymbolGap="0" LineGap="2">
  <Char Code="h" Width="10" Rect="0 0 10 19"/>
  <Char Code="i" Width="10" Rect="16 0 26 19"/>
</Font>)";

struct CursorDraw : ::testing::Test {
    oxtest::RecordingBackend* backend = nullptr;
    std::unique_ptr<ox::graphics::CRenderer> renderer = oxtest::MakeRecordingRenderer(backend, 1024, 768, 1024, 768);
    ox::graphics::CSurface surface {32, 32};
    ox::graphics::CTexture texture {&surface};
    ox::graphics::FontBlock block;
    ox::graphics::CFont font;
    CCursor cursor;

    void SetUp() override
    {
        std::vector<uint32_t> pixels(32 * 32, 0xFFFFFFFFu);
        ASSERT_TRUE(surface.LoadBits(pixels.data(), pixels.size() * 4, 32, 32, ox::graphics::FormatA8R8G8B8));
        ASSERT_TRUE(ox::graphics::BuildFontBlock(kFontXml, strlen(kFontXml), "hint", "hint.xml", &texture, block));
        font.Attach(block.data());
        font.Texture = &texture;
        ox::graphics::CImage::SetTextureLookup([this](const char*) { return &texture; });
        ASSERT_TRUE(renderer->BeginScene());
        backend->ClearRecord();
    }
    void TearDown() override { ox::graphics::CImage::SetTextureLookup(nullptr); }
    // The smallest and largest x and y of what was drawn.
    std::array<float, 4> Bounds()
    {
        renderer->Flush();
        std::array<float, 4> b {1e9f, 1e9f, -1e9f, -1e9f};
        for (const auto& draw : backend->draws)
            for (const auto& v : draw.vertices)
                b = {std::min(b[0], v.x), std::min(b[1], v.y), std::max(b[2], v.x), std::max(b[3], v.y)};
        backend->ClearRecord();
        return b;
    }
};

} // namespace

TEST_F(CursorDraw, TheObjectIsScaledToItsWidthAndTheHintStaysInTheWorkArea)
{
    ox::gui::CCursor::Instance().SetPosition({300, 200});
    ImageObjectPtrT object = State("coin");
    object->SetTextureId("white");
    object->SetSize({200, 100});
    object->SetPos({900, 900}); // ignored on the cursor
    cursor.SetCursorObject(object.get());
    cursor.SetObjectOffset(10.6f, 0);
    cursor.Draw(renderer.get());
    // Half size about the pointer (truncated), its own place ignored.
    EXPECT_EQ(Bounds(), (std::array<float, 4> {260 - 0.5f, 175 - 0.5f, 360 - 0.5f, 225 - 0.5f}));

    // No font: no hint. With one, the hint stands at the offset, or ends at the right edge.
    cursor.ClearCursor(false);
    cursor.SetHintText("hihi");
    cursor.Draw(renderer.get());
    EXPECT_EQ(Bounds()[0], 1e9f);
    cursor.SetHintFont(&font);
    cursor.Draw(renderer.get());
    EXPECT_FLOAT_EQ(Bounds()[0], 310 - 0.5f);
    ox::gui::CCursor::Instance().SetPosition({1000, 700});
    cursor.Draw(renderer.get());
    const auto b = Bounds();
    EXPECT_FLOAT_EQ(b[2], 1024 - 0.5f) << "ends at the edge";
    EXPECT_FLOAT_EQ(b[1], 710 - 0.5f) << "not moved up near the bottom";

    // Disabled hints draw nothing but keep the text; ClearCursor(true) brings them back, empty.
    cursor.SetDisableHints(true);
    cursor.Draw(renderer.get());
    EXPECT_EQ(Bounds()[0], 1e9f);
    cursor.ClearCursor(false);
    EXPECT_TRUE(cursor.GetDisableHints());
    EXPECT_EQ(cursor.GetHintText(), u"hihi");
    cursor.ClearCursor(true);
    EXPECT_FALSE(cursor.GetDisableHints());
    EXPECT_TRUE(cursor.GetHintText().empty());
}

// The widget tree: the orders of the update, draw and input walks, layers, flags, deferred
// death, geometry (rotation, hit tests, anchors) and drawing through the render state.
#include "gui/ProbeWidget.h"
#include "support/RecordingBackend.h"
#include "support/TestSupport.h"

#include <algorithm>
#include <cmath>

using namespace ox::gui;
using ox::misc::IntVector;
using oxtest::ProbeWidget;

namespace {

using Journal = std::vector<std::string>;

boost::intrusive_ptr<ProbeWidget> Probe(const char* id, float x, float y, float w, float h,
                                        uint32_t layer = LayerTop, uint32_t mask = 0)
{
    boost::intrusive_ptr<ProbeWidget> p(new ProbeWidget(id, layer, mask));
    p->SetOffset(x, y);
    p->SetSize(w, h);
    return p;
}

struct WidgetTree : ::testing::Test {
    oxtest::RecordingBackend* backend = nullptr;
    std::unique_ptr<ox::graphics::CRenderer> renderer = oxtest::MakeRecordingRenderer(backend, 1024, 768, 1024, 768);
    boost::intrusive_ptr<ProbeWidget> root = Probe("root", 0, 0, 400, 300);

    void SetUp() override { ProbeWidget::Journal().clear(); }
    // The journal since the last call.
    Journal Take() { return std::exchange(ProbeWidget::Journal(), {}); }
    Journal Drawn()
    {
        renderer->BeginScene();
        root->Draw(*renderer);
        renderer->Flush();
        return Take();
    }
    bool Click(int x, int y, bool broadcast = false) { return root->OnMouseDown({x, y}, LeftButton, 0, broadcast); }
};

std::vector<std::string> Ids(const CBaseWidget& parent)
{
    std::vector<std::string> ids;
    for (const WidgetPtrT& child : parent.GetWidgets())
        ids.push_back(child->GetId());
    return ids;
}

} // namespace

TEST_F(WidgetTree, LayersOrderUpdateDrawAndClicks)
{
    // Added in this order: the newest of equal layers goes in front, always-on-top stays in
    // front, and a LayerTop widget takes the layer of the front-most ordinary child.
    auto a = Probe("a", 5, 5, 100, 100, 1), b = Probe("b", 5, 5, 100, 100, 3), c = Probe("c", 5, 5, 100, 100, 3);
    auto d = Probe("d", 5, 5, 100, 100, LayerAlwaysOnTop), e = Probe("e", 5, 5, 100, 100);
    for (auto& w : {a, b, c, d, e})
        root->AddWidget(w);
    root->AddWidget(c); // already a child: nothing
    EXPECT_EQ(Ids(*root), (std::vector<std::string> {"d", "e", "c", "b", "a"}));
    EXPECT_EQ(e->GetLayer(), 3u);
    EXPECT_EQ(e->GetParentWidget(), root.get());

    // Update: children front to back, each before its parent's own DoUpdate.
    root->Update();
    EXPECT_EQ(Take(), (Journal {"update d", "update e", "update c", "update b", "update a", "update root"}));
    // Draw: the parent first, then the children back to front.
    EXPECT_EQ(Drawn(), (Journal {"draw root", "draw a", "draw b", "draw c", "draw e", "draw d"}));

    // A click goes front to back to the children under it, in their own coordinates, until one
    // handles it.
    d->handles = e->handles = c->handles = false;
    EXPECT_TRUE(Click(20, 30));
    EXPECT_EQ(Take(), (Journal {"down root 20,30", "down d 15,25", "down e 15,25", "down c 15,25", "down b 15,25"}));
    EXPECT_TRUE(Click(200, 200)) << "the root itself handles what no child takes";
    EXPECT_EQ(Take(), (Journal {"down root 200,200"}));

    // A new layer takes effect at the end of the parent's next update; laying in front takes
    // the other's layer.
    a->SetLayer(5);
    EXPECT_EQ(Ids(*root).back(), "a");
    root->Update();
    EXPECT_EQ(Ids(*root), (std::vector<std::string> {"d", "a", "e", "c", "b"}));
    b->LayInFront(*e);
    EXPECT_EQ(Ids(*root), (std::vector<std::string> {"d", "a", "b", "e", "c"}));
    EXPECT_EQ(b->GetLayer(), 3u);
    EXPECT_EQ(root->GetWidget("c"), c.get());
    EXPECT_EQ(root->GetWidget("zz", true), nullptr);
}

TEST_F(WidgetTree, HiddenAndDisabledWidgets)
{
    auto hidden = Probe("hidden", 0, 0, 50, 50), disabled = Probe("disabled", 0, 0, 50, 50);
    auto inner = Probe("inner", 0, 0, 50, 50, LayerTop, BroadcastOnKeyDown);
    disabled->AddWidget(inner);
    root->AddWidget(hidden);
    root->AddWidget(disabled);
    hidden->AddFlags(FlagHidden);
    disabled->AddFlags(FlagDisabled | FlagHidden);
    disabled->RemFlags(FlagHidden);
    hidden->handles = false;

    // A disabled widget has no DoUpdate of its own; its children are updated. Hidden updates.
    root->Update();
    EXPECT_EQ(Take(), (Journal {"update inner", "update hidden", "update root"}));
    // A hidden widget is not drawn; a disabled one is, with its children.
    EXPECT_EQ(Drawn(), (Journal {"draw root", "draw disabled", "draw inner"}));
    // A hidden widget still gets input; a disabled one and its children get none.
    EXPECT_TRUE(Click(10, 10));
    EXPECT_EQ(Take(), (Journal {"down root 10,10", "down hidden 10,10"}));
    EXPECT_FALSE(root->OnKeyDown('A', 0, 0, false));
    EXPECT_EQ(Take(), (Journal {"key root"}));
}

TEST_F(WidgetTree, DeadWidgetLeavesAtTheParentsNextUpdate)
{
    auto killer = Probe("killer", 0, 0, 10, 10), victim = Probe("victim", 0, 0, 10, 10);
    auto stranger = Probe("stranger", 0, 0, 10, 10);
    root->AddWidget(victim);
    root->AddWidget(killer); // in front: updated first
    killer->onUpdate = [&] {
        EXPECT_TRUE(root->RemoveWidget(victim));
        EXPECT_FALSE(root->RemoveWidget(stranger.get())) << "not a child";
    };
    root->Update();
    EXPECT_TRUE(victim->GetFlags() & FlagDead);
    EXPECT_FALSE(stranger->GetFlags() & FlagDead);
    EXPECT_EQ(Ids(*root), (std::vector<std::string> {"killer", "victim"})) << "still listed during this update";
    EXPECT_EQ(Take(), (Journal {"update killer", "update victim", "update root"}));
    // A dead widget gets no input while it waits.
    killer->handles = false;
    Click(5, 5);
    EXPECT_EQ(Take(), (Journal {"down root 5,5", "down killer 5,5"}));

    killer->onUpdate = nullptr;
    root->Update();
    EXPECT_EQ(Ids(*root), (std::vector<std::string> {"killer"}));
    EXPECT_EQ(victim->GetParentWidget(), nullptr);
    root->RemoveAllWidgets();
    EXPECT_TRUE(root->GetWidgets().empty());
    EXPECT_EQ(killer->GetParentWidget(), nullptr);
    // A child held elsewhere outlives its parent without a link to it.
    root->AddWidget(killer);
    root.reset();
    EXPECT_EQ(killer->GetParentWidget(), nullptr);
}

TEST_F(WidgetTree, BroadcastPassReachesWhoAskedOnly)
{
    // `plain` asked for nothing, its child `asker` for mouse downs; `off` asked but is disabled.
    auto plain = Probe("plain", 500, 500, 10, 10), asker = Probe("asker", 2, 3, 5, 5, LayerTop, BroadcastOnMouseDown);
    auto off = Probe("off", 0, 0, 10, 10, LayerTop, BroadcastOnMouseDown);
    plain->AddWidget(asker);
    root->AddWidget(plain);
    root->AddWidget(off);
    off->AddFlags(FlagDisabled);
    EXPECT_EQ(plain->GetChildrenBroadcastMask(), static_cast<uint32_t>(BroadcastOnMouseDown));
    // Far from both: only the asker hears it, in its own coordinates; its parent is not told.
    EXPECT_FALSE(Click(100, 100, true)) << "the probe answers false in the broadcast pass";
    EXPECT_EQ(Take(), (Journal {"down root 100,100 b", "down asker -402,-403 b"}));
}

TEST_F(WidgetTree, RotatedWidgetHitsByItsPolygonAndEdgesAreOutside)
{
    auto turned = Probe("turned", 200, 100, 100, 20);
    turned->SetRotation(ox::misc::MatrixRotation(static_cast<float>(M_PI / 2)));
    auto edge = Probe("edge", 10, 10, 20, 20);
    root->AddWidget(turned);
    root->AddWidget(edge);
    root->handles = false;
    // A quarter turn about (200, 100) puts the 100 x 20 widget over x 180..200, y 100..200.
    EXPECT_EQ(turned->AdaptPos({190, 150}), IntVector(50, 10));
    EXPECT_TRUE(Click(190, 150));
    EXPECT_FALSE(Click(250, 110)) << "inside the unturned rectangle only";
    EXPECT_FALSE(Click(10, 15)) << "on the left edge";
    EXPECT_TRUE(Click(11, 15));
    EXPECT_EQ(Take(), (Journal {"down root 190,150", "down turned 50,10", "down root 250,110", "down root 10,15",
                                "down root 11,15", "down edge 1,5"}));
}

TEST_F(WidgetTree, AnchorsFollowTheParentsResize)
{
    struct Case {
        uint32_t anchors;
        float x, w, y, h; // after the parent goes from 200 x 100 to 300 x 200
    } cases[] = {
        {AnchorLeft | AnchorRight | AnchorTop | AnchorBottom, 20, 150, 10, 130}, // both margins kept
        {AnchorRight | AnchorBottom, 120, 50, 110, 30},                          // the far margins kept
        {AnchorLeft | AnchorTop, 20, 50, 10, 30},                                // nothing moves
        {0, 30, 75, 20, 60},                                                     // scaled by 1.5 and 2
    };
    root->SetSize(200, 100);
    std::vector<boost::intrusive_ptr<ProbeWidget>> children;
    for (const Case& c : cases) {
        children.push_back(Probe("child", 20, 10, 50, 30));
        children.back()->SetAnchors(c.anchors);
        root->AddWidget(children.back());
    }
    root->SetSize(300, 200);
    for (size_t i = 0; i < children.size(); ++i) {
        SCOPED_TRACE(i);
        EXPECT_EQ(children[i]->GetOffset(), ox::misc::FloatVector(cases[i].x, cases[i].y));
        EXPECT_EQ(children[i]->GetSize(), ox::misc::FloatVector(cases[i].w, cases[i].h));
    }
}

TEST_F(WidgetTree, DrawsThroughTheRenderStateWithClipColourAndWholePixels)
{
    root->SetOffset(10.7f, 20.2f);
    root->SetColor(ox::graphics::Color(0x80FFFFFFu));
    root->SetSize(50, 40);
    root->AddFlags(FlagClipDraw);
    auto big = Probe("big", 0.5f, 0.5f, 100, 100);
    big->AddFlags(FlagDrawFloatRect);
    root->AddWidget(big);
    Drawn();
    ASSERT_EQ(backend->draws.size(), 1u) << "both quads in one batch";
    const auto& v = backend->draws[0].vertices;
    ASSERT_GE(v.size(), 12u);
    // The root at whole pixels (10, 20); the child at its exact offset, cut to the root's 50 x 40.
    EXPECT_FLOAT_EQ(v[0].x, 9.5f);
    EXPECT_FLOAT_EQ(v[0].y, 19.5f);
    float maxX = 0, maxY = 0, minX = 1e9f;
    for (size_t i = 6; i < v.size(); ++i) {
        maxX = std::max(maxX, v[i].x);
        maxY = std::max(maxY, v[i].y);
        minX = std::min(minX, v[i].x);
        EXPECT_EQ(v[i].diffuse >> 24, 0x80u) << "the parent's colour multiplies the child's";
    }
    EXPECT_FLOAT_EQ(minX, 10.0f);
    EXPECT_FLOAT_EQ(maxX, 59.5f);
    EXPECT_FLOAT_EQ(maxY, 59.5f);
    // The state is restored after the walk.
    EXPECT_EQ(renderer->GetState().GetClipPoly(), nullptr);
    EXPECT_EQ(renderer->GetColor(), ox::graphics::Color());
}

namespace {

struct JournalEffect : CEffect {
    std::string name;
    explicit JournalEffect(std::string n) : name(std::move(n)) {}
    void Note(const char* what) { ProbeWidget::Journal().push_back(std::string(what) + " " + name); }
    void InitWidget(CBaseWidget&) override { Note("init"); }
    void UpdateWidget(CBaseWidget&) override { Note("effect"); }
    void PreDraw(ox::graphics::CRenderer&) override { Note("pre"); }
    void PostDraw(ox::graphics::CRenderer&) override { Note("post"); }
};

} // namespace

TEST_F(WidgetTree, EffectsRunBeforeTheChildrenAndAroundTheDraw)
{
    boost::intrusive_ptr<JournalEffect> first(new JournalEffect("1")), second(new JournalEffect("2"));
    root->AddEffect(first);
    root->AddEffect(second);
    root->AddWidget(Probe("child", 0, 0, 5, 5));
    EXPECT_EQ(Take(), (Journal {"init 1", "init 2"}));
    root->Update();
    EXPECT_EQ(Take(), (Journal {"effect 1", "effect 2", "update child", "update root"}));
    EXPECT_EQ(Drawn(), (Journal {"pre 1", "pre 2", "draw root", "draw child", "post 1", "post 2"}));
    first->SetDead(true);
    root->Update();
    EXPECT_EQ(Take(), (Journal {"effect 2", "update child", "update root"}));
    EXPECT_EQ(root->GetEffects().size(), 1u);
}

// The widget tree's per-frame walks and the layout pass, drawing into a backend that
// discards vertices: the cost of the tree, the render state and the renderer alone.
#include "NullBackend.h"
#include "core/Settings.h"
#include "graphics/Renderer.h"
#include "graphics/Texture.h"
#include "graphics/Font.h"
#include "graphics/Image.h"
#include "gui/GuiServices.h"
#include "gui/LayoutBox.h"
#include "gui/WidgetFactory.h"
#include "gui/WidgetManager.h"
#include "gui/controls/ScrollWidget.h"
#include "gui/controls/TableWidget.h"
#include "gui/controls/TreeWidget.h"
#include "gui/Window.h"

#include <benchmark/benchmark.h>

#include <cstring>
#include <deque>
#include <string>

using namespace ox::gui;
using oxbench::NullBackend;

namespace {

// A widget that draws one sprite over its rectangle and counts its updates.
class SpriteWidget : public CWidget {
public:
    static inline const ox::graphics::CTexture* s_Texture = nullptr;
    unsigned updates = 0;

    void DoUpdate() override { ++updates; }
    void DoDraw(ox::graphics::CRenderer& renderer) override
    {
        renderer.RenderTexture(s_Texture, ox::misc::FloatRect(0, 0, GetSize().X, GetSize().Y));
        CWidget::DoDraw(renderer);
    }
};

struct Frame {
    NullBackend* backend;
    ox::graphics::CRenderer renderer;
    ox::graphics::CSurface surface {64, 64};
    ox::graphics::CTexture texture {&surface};

    Frame() : Frame(std::make_unique<NullBackend>()) {}
    explicit Frame(std::unique_ptr<NullBackend> owned) : backend(owned.get()), renderer(std::move(owned))
    {
        renderer.SetSourceResolution(1024, 768);
        renderer.InitWindow(true, true, 1920, 1080);
        SpriteWidget::s_Texture = &texture;
    }
};

// Breadth first, six children to a widget, to `count` widgets on six levels. Each widget
// covers a share of its parent; every 7th is hidden, every 11th disabled, every 13th clips
// its children, every 17th is drawn at exact positions and every 29th is turned a little.
WidgetPtrT BuildTree(unsigned count)
{
    WidgetPtrT root(new SpriteWidget());
    root->SetSize(1024, 768);
    std::deque<std::pair<CWidget*, int>> open {{root.get(), 0}};
    for (unsigned made = 1; made < count && !open.empty(); open.pop_front()) {
        auto [parent, depth] = open.front();
        if (depth == 5)
            continue;
        for (int i = 0; i < 6 && made < count; ++i, ++made) {
            WidgetPtrT child(new SpriteWidget());
            const ox::misc::FloatVector size = parent->GetSize();
            child->SetOffset(size.X * (i % 3) / 3 + 1.5f, size.Y * (i / 3) / 2 + 1.5f);
            child->SetSize(size.X / 3 - 2, size.Y / 2 - 2);
            uint32_t flags = 0;
            flags |= made % 7 == 0 ? FlagHidden : 0u;
            flags |= made % 11 == 0 ? FlagDisabled : 0u;
            flags |= made % 13 == 0 ? FlagClipDraw : 0u;
            flags |= made % 17 == 0 ? FlagDrawFloatRect : 0u;
            child->SetFlags(flags);
            if (made % 29 == 0)
                child->SetRotation(ox::misc::MatrixRotation(0.05f));
            parent->AddWidget(child);
            open.emplace_back(child.get(), depth + 1);
        }
    }
    return root;
}

} // namespace

// One frame of a 5,000-widget tree: the update walk, then the draw walk into the batch.
static void BM_WidgetTreeFrame(benchmark::State& state)
{
    Frame frame;
    WidgetPtrT root = BuildTree(static_cast<unsigned>(state.range(0)));
    for (auto _ : state) {
        frame.renderer.BeginScene();
        root->Update();
        root->Draw(frame.renderer);
        frame.renderer.EndScene();
    }
    state.SetItemsProcessed(state.iterations());
    state.counters["vertices/frame"] =
        static_cast<double>(frame.backend->vertices) / static_cast<double>(state.iterations());
}
BENCHMARK(BM_WidgetTreeFrame)->Arg(5000)->Unit(benchmark::kMicrosecond);

namespace {

// A panel of rows: each row a horizontal box of widgets, flexible ones among them, and
// spacers; some widgets hold a vertical box of their own. `rows` rows of 17 boxes.
std::string LayoutDescription(int rows)
{
    std::string xml = "<?xml version=\"1.0\"?><sprite_widget width=\"1000\" orient=\"vertical\"><insets left=\"8\" right=\"8\" top=\"8\"/>";
    for (int r = 0; r < rows; ++r) {
        xml += "<hbox align=\"center\" pack=\"center\">";
        for (int i = 0; i < 6; ++i) {
            xml += "<sprite_widget width=\"40\" height=\"" + std::to_string(10 + i) + "\"/>";
            xml += i % 2 ? "<spacer flex=\"1\"/>" : "<spacer width=\"4\"/>";
        }
        xml += "<sprite_widget flex=\"2\" height=\"12\"><vbox><sprite_widget width=\"20\" height=\"5\"/>"
               "<sprite_widget width=\"20\" height=\"5\"/></vbox></sprite_widget>";
        xml += "</hbox>";
    }
    return xml + "</sprite_widget>";
}

} // namespace

// A layout pass (measure, share out, place) over a description of about 1,000 boxes.
static void BM_LayoutPass(benchmark::State& state)
{
    GetWidgetFactory().RegisterWidget<SpriteWidget>("sprite_widget");
    const std::string xml = LayoutDescription(static_cast<int>(state.range(0)));
    ox::core::CSettings settings;
    settings.LoadXmlFromMemory(xml.data(), xml.size(), "bench.xml");
    WidgetPtrT root(new SpriteWidget());
    root->Load(settings.GetFirstChild(), ox::core::CSettingsGroup::Empty());
    size_t boxes = 0;
    auto count = [&](const CLayoutBox& box, auto& self) -> void {
        ++boxes;
        for (const LayoutBoxPtrT& child : box.GetChildren())
            self(*child, self);
    };
    count(*root->GetLayoutBox(), count);
    for (auto _ : state) {
        root->UpdateLayout();
        benchmark::DoNotOptimize(root->GetSize());
    }
    state.SetItemsProcessed(state.iterations());
    state.counters["boxes"] = static_cast<double>(boxes);
}
BENCHMARK(BM_LayoutPass)->Arg(59)->Unit(benchmark::kMicrosecond);

namespace {

// The widget a click is meant for: it takes the press and the release, and asks for the
// broadcast release as a button does.
class TargetWidget : public CWidget {
public:
    unsigned downs = 0, ups = 0;
    TargetWidget() : CWidget({}, LayerTop, BroadcastOnMouseUp) {}
    bool OnMouseDown(const ox::misc::IntVector&, MouseButtons, int, bool broadcast) override
    {
        downs += broadcast ? 0 : 1;
        return true;
    }
    bool OnMouseUp(const ox::misc::IntVector&, MouseButtons, int, bool broadcast) override
    {
        ups += broadcast ? 0 : 1;
        return !broadcast;
    }
};

// A side branch of a tree: a widget holding four children, each holding five: 25 widgets.
WidgetPtrT SideBranch(ox::misc::FloatVector at)
{
    WidgetPtrT branch(new CWidget());
    branch->SetOffset(at.X, at.Y);
    branch->SetSize(40, 40);
    for (int i = 0; i < 4; ++i) {
        WidgetPtrT child(new CWidget());
        child->SetOffset(2.0f * static_cast<float>(i), 2);
        child->SetSize(8, 8);
        for (int j = 0; j < 5; ++j) {
            WidgetPtrT leaf(new CWidget());
            leaf->SetSize(2, 2);
            child->AddWidget(leaf);
        }
        branch->AddWidget(child);
    }
    return branch;
}

// A window whose tree is `depth` levels deep along the path to the target at the canvas
// point (500, 400). On each level the path's widget stands behind four siblings (so the hit
// test tries them first), each a side branch of 25 widgets: 101 widgets a level.
boost::intrusive_ptr<CWindow> ClickTree(int depth, TargetWidget*& target, unsigned& count)
{
    boost::intrusive_ptr<CWindow> window(new CWindow());
    window->SetSize(1024, 768);
    CBaseWidget* parent = window.get();
    count = 1;
    for (int level = 0; level < depth; ++level) {
        const bool last = level == depth - 1;
        WidgetPtrT path(last ? static_cast<CWidget*>(target = new TargetWidget()) : new CWidget());
        path->SetOffset(10, 10);
        path->SetSize(1000 - 20.0f * static_cast<float>(level), 700 - 20.0f * static_cast<float>(level));
        parent->AddWidget(path);
        for (int i = 0; i < 4; ++i) {
            parent->AddWidget(SideBranch({45.0f * static_cast<float>(i), 0}));
            count += 25;
        }
        count += 1;
        parent = path.get();
    }
    return window;
}

} // namespace

// A left click, the press and the release as the platform delivers them, through the widget
// manager's two passes each, down a 20-deep tree of 2,021 widgets to the hit widget.
static void BM_ClickDispatch(benchmark::State& state)
{
    TargetWidget* target = nullptr;
    unsigned count = 0;
    CWidgetManager manager;
    manager.SetActiveRect({0, 0, 1024, 768}, {1, 1});
    manager.SetMainWindow(ClickTree(static_cast<int>(state.range(0)), target, count));
    manager.Update();
    ox::core::SystemEvent down, up;
    down.message = ox::core::WM_LBUTTONDOWN;
    up.message = ox::core::WM_LBUTTONUP;
    down.lParam = up.lParam = ox::core::MakeLong(500, 400);
    for (auto _ : state) {
        manager.OnWindowMessage(down);
        manager.OnWindowMessage(up);
    }
    if (target->downs != state.iterations() || target->ups != state.iterations())
        state.SkipWithError("the clicks did not reach the target widget");
    state.SetItemsProcessed(state.iterations());
    state.counters["widgets"] = static_cast<double>(count);
}
BENCHMARK(BM_ClickDispatch)->Arg(20)->Unit(benchmark::kMicrosecond);

namespace {

// A font of the letters a to z, each 10 wide and 20 high, on a 256 x 64 glyph texture.
std::string MenuFontXml()
{
    std::string xml = "<?xml version=\"1.0\"?><Font Padding=\"0 0 0 0\" Space=\"5\" PixHeight=\"20\" Baseline=\"6\" "
                      "SymbolGap=\"1\" LineGap=\"0\">";
    for (int i = 0; i < 26; ++i)
        xml += "<Char Code=\"" + std::string(1, static_cast<char>('a' + i)) + "\" Width=\"10\" Rect=\"" +
               std::to_string(i % 25 * 10) + " " + std::to_string(i / 25 * 20) + " " + std::to_string(i % 25 * 10 + 10) +
               " " + std::to_string(i / 25 * 20 + 20) + "\"/>";
    return xml + "</Font>";
}

// A menu window of `count` controls in rows of four: labels with a word of text and
// buttons with a four-state image and a label, found by id as a game's would be.
std::string MenuDescription(int count)
{
    std::string xml = "<?xml version=\"1.0\"?><gui><window width=\"1024\" height=\"768\" orient=\"vertical\">";
    for (int i = 0; i < count; ++i) {
        if (i % 4 == 0)
            xml += i ? "</hbox><hbox>" : "<hbox>";
        xml += i % 2 ? "<button_widget button_template=\"b\" text=\"press\" width=\"60\" height=\"10\"/>"
                     : "<label_widget label_template=\"l\" text=\"menu label\"/>";
    }
    xml += "</hbox></window><GUITemplates><label_template id=\"l\" font=\"mono\"/>"
           "<button_template id=\"b\" image=\"strip\" label_template=\"l\" image_fade_time=\"0.2\"/>"
           "</GUITemplates></gui>";
    return xml;
}

} // namespace

namespace {

// The mono font of MenuFontXml and one strip texture that every image id finds, set as the
// GUI's look-ups for the length of a benchmark.
struct GuiAssets {
    ox::graphics::CSurface glyphSurface {256, 64}, stripSurface {256, 16};
    ox::graphics::CTexture glyphs {&glyphSurface}, strip {&stripSurface};
    ox::graphics::FontBlock block;
    ox::graphics::CFont font;
    bool ready = false;

    GuiAssets()
    {
        const std::string fontXml = MenuFontXml();
        if (!ox::graphics::BuildFontBlock(fontXml.data(), fontXml.size(), "mono", "mono.xml", &glyphs, block))
            return;
        font.Attach(block.data());
        font.Texture = &glyphs;
        GetGuiServices().findFont = [this](const char*) { return &font; };
        ox::graphics::CImage::SetTextureLookup([this](const char*) { return &strip; });
        RegisterFrameworkWidgets(GetWidgetFactory());
        ready = true;
    }
    ~GuiAssets()
    {
        GetGuiServices().findFont = nullptr;
        ox::graphics::CImage::SetTextureLookup(nullptr);
    }
    GuiAssets(const GuiAssets&) = delete;
    GuiAssets& operator=(const GuiAssets&) = delete;
};

// The description's first widget element, loaded with its templates.
template <class W>
boost::intrusive_ptr<W> LoadDescription(const std::string& xml, ox::core::CSettings& settings)
{
    settings.LoadXmlFromMemory(xml.data(), xml.size(), "bench.xml");
    boost::intrusive_ptr<W> widget(new W());
    widget->Load(settings.GetFirstChild().GetFirstChild(), settings.GetFirstChild().GetChild("GUITemplates"));
    return widget;
}

} // namespace

// One frame of a menu window of 200 controls (labels with text, buttons with images and
// labels): the update walk, then the draw walk with the text laid out.
static void BM_MenuFrame(benchmark::State& state)
{
    Frame frame;
    GuiAssets assets;
    if (!assets.ready) {
        state.SkipWithError("the font cannot be built");
        return;
    }
    ox::core::CSettings settings;
    auto window = LoadDescription<CWindow>(MenuDescription(static_cast<int>(state.range(0))), settings);
    window->UpdateLayout();
    // The rows are bare boxes: the controls are the window's children.
    const double controls = static_cast<double>(window->GetWidgets().size());
    for (auto _ : state) {
        frame.renderer.BeginScene();
        window->Update();
        window->Draw(frame.renderer);
        frame.renderer.EndScene();
    }
    state.SetItemsProcessed(state.iterations());
    state.counters["controls"] = controls;
    state.counters["vertices/frame"] =
        static_cast<double>(frame.backend->vertices) / static_cast<double>(state.iterations());
}
BENCHMARK(BM_MenuFrame)->Arg(200)->Unit(benchmark::kMicrosecond);


namespace {

// A table of `rows` rows of five labelled cells, twenty rows shown at a time under a title,
// with a scroll bar; the second column takes what the others leave.
std::string TableDescription(int rows)
{
    std::string xml = "<?xml version=\"1.0\"?><gui><table_widget table_template=\"t\" table_height=\"20\" "
                      "has_title=\"true\" enable_selection=\"true\" width=\"600\"><rows>";
    for (int r = 0; r < rows; ++r) {
        xml += "<row>";
        for (int c = 0; c < 5; ++c)
            xml += "<cell flex=\"" + std::string(c == 1 ? "1" : "0") + "\"><label_widget label_template=\"l\" text=\"" +
                   std::string(c == 1 ? "name of a player" : "cell") + "\"/></cell>";
        xml += "</row>";
    }
    return xml + "</rows></table_widget><GUITemplates><label_template id=\"l\" font=\"mono\"/>"
                 "<scroll_template id=\"s\" vertical=\"true\" thumb_image=\"strip\" back_image=\"strip\" "
                 "top_image=\"strip\" bottom_image=\"strip\"/><table_template id=\"t\" default_back_image=\"strip\" "
                 "default_selection_back=\"strip\" lines_image=\"strip\" scroll_template=\"s\"/></GUITemplates></gui>";
}

} // namespace

// One frame of a table of 1,000 rows of 5 cells: the bar moves on by a row's height (the
// cells are placed again) and the table is drawn, title, rows in view and grid.
static void BM_TableFrame(benchmark::State& state)
{
    Frame frame;
    GuiAssets assets;
    ox::core::CSettings settings;
    auto table = LoadDescription<CTableWidget>(TableDescription(static_cast<int>(state.range(0))), settings);
    CScrollWidget* scroll = table->GetScroll();
    if (!assets.ready || !scroll || table->GetCellsCount() != 5 * state.range(0)) {
        state.SkipWithError("the table was not built");
        return;
    }
    float value = 0;
    for (auto _ : state) {
        value = value + 20 > scroll->GetMaxValue() - scroll->GetPageSize() ? 0 : value + 20;
        scroll->SetValue(value);
        frame.renderer.BeginScene();
        table->Draw(frame.renderer);
        frame.renderer.EndScene();
    }
    state.SetItemsProcessed(state.iterations());
    state.counters["cells"] = static_cast<double>(table->GetCellsCount());
    state.counters["vertices/frame"] =
        static_cast<double>(frame.backend->vertices) / static_cast<double>(state.iterations());
}
BENCHMARK(BM_TableFrame)->Arg(1000)->Unit(benchmark::kMicrosecond);

// A click on the expand box of a closed group of 1,000 children: it opens and the bars are
// fitted to the rows now in view. (Closing it again is not measured.)
static void BM_TreeExpand(benchmark::State& state)
{
    GuiAssets assets;
    const std::string xml = "<?xml version=\"1.0\"?><gui><tree_widget tree_template=\"t\" width=\"300\" "
                            "height=\"400\"/><GUITemplates><tree_template id=\"t\" font=\"mono\" offset=\"16\">"
                            "<vertical_scroll scroll_template=\"s\"/><horizontal_scroll scroll_template=\"s\"/>"
                            "</tree_template><scroll_template id=\"s\" thumb_image=\"strip\"/></GUITemplates></gui>";
    ox::core::CSettings settings;
    auto tree = LoadDescription<CTreeWidget>(xml, settings);
    CTreeWidget::CNode* group = tree->AddNode(u"group", nullptr, CTreeWidget::CNode::FlagGroup);
    for (int i = 0; i < state.range(0); ++i)
        tree->AddNode(u"child node " + ox::wstring(1, static_cast<char16_t>(u'a' + i % 26)), group, 0);
    const ox::misc::IntVector box(4, 4);
    for (auto _ : state) {
        tree->OnMouseDown(box, LeftButton, 0, false);
        state.PauseTiming();
        if (!group->ReadFlag(CTreeWidget::CNode::FlagExpanded))
            state.SkipWithError("the group did not open");
        tree->OnMouseDown(box, LeftButton, 0, false);
        state.ResumeTiming();
    }
    state.SetItemsProcessed(state.iterations());
}
BENCHMARK(BM_TreeExpand)->Arg(1000)->Unit(benchmark::kMicrosecond);

BENCHMARK_MAIN();

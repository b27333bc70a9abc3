// The widget tree's per-frame walks and the layout pass, drawing into a backend that
// discards vertices: the cost of the tree, the render state and the renderer alone.
#include "NullBackend.h"
#include "core/Settings.h"
#include "graphics/Renderer.h"
#include "graphics/Texture.h"
#include "gui/LayoutBox.h"
#include "gui/WidgetFactory.h"

#include <benchmark/benchmark.h>

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

BENCHMARK_MAIN();

#include "game/DemoScene.h"

#include "core/Application.h"
#include "core/FontManager.h"
#include "core/SettingsReaders.h"
#include "graphics/Font.h"
#include "diag/Log.h"
#include "gui/Cursor.h"
#include "gui/Window.h"
#include "gui/WidgetFactory.h"
#include "core/TextureManager.h"
#include "misc/StringTable.h"
#include "quest/Area.h"
#include "quest/ClipObject.h"
#include "quest/GameCursor.h"
#include "quest/ImageObject.h"

#include <cmath>
#include <cstdio>

namespace k17 {

using namespace ox;
using graphics::Color;
using misc::FloatRect;
using misc::FloatVector;

namespace {

constexpr int kTextureSize = 48;

// A framed tile: a bright border of 4 pixels, a checker inside, a soft alpha toward the
// corners, so that both the nine-part box and blending show.
std::vector<uint32_t> MakeTile()
{
    std::vector<uint32_t> pixels(kTextureSize * kTextureSize);
    for (int y = 0; y < kTextureSize; ++y)
        for (int x = 0; x < kTextureSize; ++x) {
            const bool border = x < 4 || y < 4 || x >= kTextureSize - 4 || y >= kTextureSize - 4;
            const bool checker = ((x / 8) + (y / 8)) % 2 == 0;
            uint32_t rgb = border ? 0xF0C040u : (checker ? 0x4080E0u : 0x203870u);
            const float dx = x - (kTextureSize - 1) / 2.0f, dy = y - (kTextureSize - 1) / 2.0f;
            const float d = std::sqrt(dx * dx + dy * dy) / (kTextureSize / 2.0f);
            const uint32_t alpha = d > 1.2f ? 0x60u : 0xFFu;
            pixels[y * kTextureSize + x] = alpha << 24 | rgb;
        }
    return pixels;
}

// A box of the demo's panel and window: a filled rectangle (`fill`, "#a r g b") with an
// outline and an optional caption in the small font. Its colour stays white, so its children
// keep theirs. With `clickable="true"` a left click on it tells its window "pressed"; with
// `dialog="<window id>"` the click also opens that window as a modal dialog over its window.
class CDemoBoxWidget : public gui::CWidget {
public:
    void Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates) override
    {
        CWidget::Load(node, templates);
        core::ReadColor(node, "fill", m_Fill);
        m_Caption = core::ReadLocalText(node, "caption");
        core::ReadBool(node, "clickable", m_Clickable);
        m_Dialog = node.GetValue("dialog");
        if (m_Clickable)
            SetBroadcastMask(GetBroadcastMask() | gui::BroadcastOnMouseUp);
    }

    void DoDraw(graphics::CRenderer& r) override
    {
        const FloatRect rect(0, 0, GetSize().X, GetSize().Y);
        r.RenderFilledPoly4(misc::RectToPoly4(rect), m_Pressed ? Color(0xFFFFF0A0u) : m_Fill);
        r.RenderRect(rect, Color(0x80FFFFFFu));
        const graphics::CFont* font = core::CFontManager::Instance().GetItem("small");
        if (font && !m_Caption.empty())
            r.RenderString(font, m_Caption, rect.Width / 2, rect.Height / 2, graphics::JustifyCenterH,
                           graphics::JustifyCenterV, 1.0f, Color(0xFF101010u));
        CWidget::DoDraw(r);
    }

    bool OnMouseMove(const misc::IntVector& pos, int keys, bool broadcast) override
    {
        if (!m_Clickable || broadcast)
            return CWidget::OnMouseMove(pos, keys, broadcast);
        gui::CCursor::Instance().SetCursor(gui::CCursor::CursorHand);
        return true;
    }

    bool OnMouseDown(const misc::IntVector& pos, gui::MouseButtons button, int keys, bool broadcast) override
    {
        if (!m_Clickable || broadcast || button != gui::LeftButton)
            return CWidget::OnMouseDown(pos, button, keys, broadcast);
        m_Pressed = true;
        return true;
    }

    // Released over the box after a press on it: a click. Released anywhere (the broadcast
    // pass): the press is over.
    bool OnMouseUp(const misc::IntVector& pos, gui::MouseButtons button, int keys, bool broadcast) override
    {
        if (!m_Clickable || button != gui::LeftButton)
            return CWidget::OnMouseUp(pos, button, keys, broadcast);
        const bool click = m_Pressed && !broadcast;
        m_Pressed = false;
        if (click)
            Click();
        return click;
    }

private:
    void Click()
    {
        gui::WidgetPtrT self(this);
        OnChildAction("pressed", this);
        if (!m_Dialog.empty() && GetParentWidget())
            OpenDialog();
    }

    void OpenDialog()
    {
        gui::CBaseWidget* top = this;
        while (auto* widget = dynamic_cast<gui::CWidget*>(top))
            top = widget->GetParentWidget();
        auto* window = dynamic_cast<gui::CBaseWindow*>(top);
        const core::CSettings& settings = core::g_Application->GetSettings();
        const core::CSettingsGroup& node = settings.GetChildByAttribute("window", "id", m_Dialog, true);
        if (!window || &node == &core::CSettingsGroup::Empty()) {
            OX_LOG("data", diag::LogWarning, "demo: no window \"%s\" to open", m_Dialog.c_str());
            return;
        }
        gui::WindowPtrT dialog(new gui::CWindow());
        dialog->Load(node, settings.GetChild("GUITemplates"));
        dialog->UpdateLayout();
        const int result = window->DoModal(dialog);
        std::printf("Lantern Demo: the dialog %s closed with %d\n", m_Dialog.c_str(), result);
        std::fflush(stdout);
    }

    Color m_Fill {0xFF808080u};
    wstring m_Caption;
    bool m_Clickable = false;
    bool m_Pressed = false;
    std::string m_Dialog;
};

// The top layer of the level's window: the game cursor (the object on the pointer and the
// hint) drawn over everything. It takes no input.
class CDemoCursorLayer : public gui::CWidget {
public:
    void DoDraw(graphics::CRenderer& r) override
    {
        CWidget::DoDraw(r);
        qe::g_Cursor::Instance().Draw(&r);
    }
};

} // namespace

CDemoScene::CDemoScene(graphics::CRenderer& renderer) : m_Renderer(renderer), m_Pixels(MakeTile())
{
    m_Surface = std::make_unique<graphics::CSurface>(kTextureSize, kTextureSize);
    m_Texture = std::make_unique<graphics::CTexture>(m_Surface.get());
    m_Renderer.AddDeviceResourceOwner(this);
}

CDemoScene::~CDemoScene()
{
    m_Renderer.RemoveDeviceResourceOwner(this);
    m_Texture.reset();
    m_Surface.reset();
}

void CDemoScene::TakeDeclaredTextures()
{
    m_Spinner.Init();
    m_Spinner.SetTexture("demo_spinner");
    m_Spinner.SetRect({60, 612, 96, 96});
    m_Disc.Init();
    m_Disc.SetTexture("demo_disc");
    m_Disc.SetRect({180, 612, 96, 96});
    m_Stone.Init();
    m_Stone.SetTexture("demo_stone");
    m_Stone.SetRect({300, 612, 96, 96});
    m_Frame.Init();
    m_Frame.SetTexture("demo_frame");
    m_Frame.SetRect({420, 612, 220, 96});
    m_Frame.SetFlags(graphics::CImage::FlagBoxImage);
}

void CDemoScene::StartClip()
{
    if (m_Clip.Load("demo_show"))
        m_Clip.SetPos({790, 400});
    m_Quest.Build();
}

void CDemoScene::LoadPanel(const core::CSettingsGroup& gui, const core::CSettingsGroup& templates)
{
    gui::CWidgetFactory& factory = gui::GetWidgetFactory();
    factory.RegisterWidget<CDemoBoxWidget>("demo_box_widget");
    factory.RegisterWidget<CDemoCursorLayer>("demo_cursor_layer");
    m_Panel = factory.Create("demo_box_widget", gui.GetChildByAttribute("demo_box_widget", "id", "demo_panel"),
                             templates);
    m_Panel->UpdateLayout();
    m_PanelWidth = m_Panel->GetSize().X;
}

void CDemoScene::Update(unsigned timeMs)
{
    m_Clip.Update();
    m_Quest.Update(timeMs);
    if (!m_Panel)
        return;
    const float breath = 0.5f + 0.5f * std::sin(timeMs / 1000.0f);
    m_Panel->SetSize(m_PanelWidth + 80 * breath, m_Panel->GetSize().Y);
    m_Panel->Update();
}

void CDemoScene::ReleaseDeviceResources(bool forReset)
{
    if (!forReset)
        m_Surface->ReleaseD3D();
}

void CDemoScene::Draw(graphics::CRenderer& r, unsigned timeMs)
{
    if (!m_Surface->IsValid())
        m_Surface->LoadBits(m_Pixels.data(), m_Pixels.size() * 4, kTextureSize, kTextureSize,
                            graphics::FormatA8R8G8B8);
    const float t = timeMs / 1000.0f;
    r.Clear(Color(0xFF1C2430u));

    // A floor of filled quads and a frame of lines.
    for (int i = 0; i < 8; ++i) {
        const float shade = 0.5f + 0.5f * std::sin(t + i * 0.6f);
        const auto g = static_cast<int16_t>(60 + 80 * shade);
        r.RenderFilledPoly4(misc::RectToPoly4({40.0f + i * 120, 600, 100, 120}), Color(70, g, 110, 255));
    }
    r.RenderRect({20, 20, 984, 728}, Color(0xFFF0C040u));
    for (int i = 0; i < 12; ++i) {
        const float a = t * 0.5f + i * 3.14159265f / 6;
        r.RenderLine({512, 300}, {512 + 220 * std::cos(a), 300 + 220 * std::sin(a)}, Color(0xC0FFFFFFu));
    }

    // The tile at natural size, stretched, as a nine-part box and spinning about its centre.
    r.RenderTexture(m_Texture.get(), 60.0f, 60.0f);
    r.RenderTexture(m_Texture.get(), FloatRect(60, 140, 160, 90));
    r.RenderTextureBox(m_Texture.get(), FloatRect(60, 260, 200, 150));
    r.PushMatrix();
    r.ApplyMatrix(misc::MatrixTranslation(-80, -80) * misc::MatrixRotation(t) * misc::MatrixTranslation(830, 200));
    r.RenderTexture(m_Texture.get(), FloatRect(0, 0, 160, 160));
    r.PopMatrix();

    // Additive glows that pulse.
    r.PushBlendMode();
    r.SetBlendMode(graphics::BlendAdditive);
    const auto glow = static_cast<int16_t>(100 + 100 * (0.5f + 0.5f * std::sin(t * 2)));
    r.RenderTexture(m_Texture.get(), FloatRect(700, 420, 120, 120), 0, Color(255, 120, 40, glow));
    r.RenderTexture(m_Texture.get(), FloatRect(760, 460, 120, 120), 0, Color(40, 120, 255, glow));
    r.PopBlendMode();

    // A sprite sheet moving under a rotated clip.
    r.PushState();
    r.PushMatrix();
    r.ApplyMatrix(misc::MatrixTranslation(-90, -90) * misc::MatrixRotation(0.4f) * misc::MatrixTranslation(420, 470));
    r.SetClipPoly(misc::RectToPoly4({0, 0, 180, 180}));
    r.PopMatrix();
    for (int i = 0; i < 6; ++i) {
        const float x = 300 + std::fmod(t * 60 + i * 50, 300.0f);
        r.RenderTexture(m_Texture.get(), FloatRect(x, 380 + i * 30, 48, 48));
    }
    r.PopState();
    r.RenderTextureTriangle(m_Texture.get(), {600, 80}, {680, 200}, {540, 200}, {0.5f, 0}, {1, 1}, {0, 1},
                            Color(0xFFFFFFFFu));

    // The declared textures stand on the floor.
    m_Spinner.Draw(r);
    m_Disc.Draw(r);
    m_Stone.Draw(r);
    m_Frame.Draw(r);
    m_Clip.Draw(&r);
    m_Quest.Draw(r);
    DrawText(r, t);
    if (m_Panel)
        m_Panel->Draw(r);
}

void CDemoScene::DrawText(graphics::CRenderer& r, float t)
{
    using Renderer = graphics::CRenderer;
    core::CFontManager& fonts = core::CFontManager::Instance();
    const graphics::CFont* title = fonts.GetItem("title");
    const graphics::CFont* small = fonts.GetItem("small");
    const misc::CStringTable& strings = misc::CStringTable::Instance();

    // The game's name and the Cyrillic entry of the string table, in the title font.
    if (title) {
        r.RenderString(title, strings.FormatByStringsID("$1"), 512, 40, graphics::JustifyCenterH,
                       graphics::JustifyTop);
        const auto pulse = static_cast<int16_t>(180 + 75 * std::sin(t * 3));
        r.RenderString(title, strings.FormatByStringsID("$2"), 984, 728, graphics::JustifyRight,
                       graphics::JustifyBottom, 1.0f, Color(255, pulse, 80, 255));
    }
    if (!small)
        return;
    // A paragraph broken at word ends and justified, over a back colour.
    const misc::IntRect box(290, 520, 420, 60);
    r.RenderFilledPoly4(misc::RectToPoly4({287, 517, 426, 76}), Color(0xA0000000u));
    r.RenderText(*small,
                 u"Text is laid out in boxes: lines break at blanks, a word longer than the box breaks "
                 u"inside, and the lines are justified to the box.",
                 box, Renderer::TextWordWrap | Renderer::TextJustify, 0, Color(0xFFE8E0C0u));
    // A selection sweeping over a line, and underlined text.
    const wstring line = u"A selection sweeps over this line of text";
    const int first = static_cast<int>(t * 8) % static_cast<int>(line.size());
    r.RenderText(*small, line, misc::IntRect(300, 470, 400, 30), Renderer::TextCenterH, 0, Color(0xFFFFFFFFu),
                 Color(0u), Color(0xFF101010u), Color(0xFFF0C040u), first, first + 8);
    r.RenderText(*small, u"underlined", misc::IntRect(60, 440, 200, 30), Renderer::TextUnderline);
}

// The quest scene -----------------------------------------------------------------------

namespace {

// Where the quest scene stands on the canvas, and its size.
constexpr FloatRect kQuestFrame {270, 90, 250, 160};

template <class T>
boost::intrusive_ptr<T> Placed(T* object, const char* id, FloatVector pos, FloatVector size, float angle = 0)
{
    object->SetId(id);
    object->SetPos(pos);
    object->SetSize(size);
    object->SetAngle(angle);
    return boost::intrusive_ptr<T>(object);
}

qe::ImageObjectPtrT Image(const char* id, const char* texture, FloatVector pos, FloatVector size, float angle = 0)
{
    qe::ImageObjectPtrT image = Placed(new qe::CImageObject(), id, pos, size, angle);
    image->SetTextureId(texture);
    return image;
}

} // namespace

void CDemoQuestScene::Build()
{
    m_Level.reset(new qe::CLevel());
    m_Scene.reset(new qe::CScene());
    m_Scene->SetSize({kQuestFrame.Width, kQuestFrame.Height});
    m_Level->InsertScene(m_Scene, nullptr);

    // Front first: what is inserted behind the last object lies below it.
    auto append = [this](qe::BaseSceneObjectPtrT object) {
        m_Scene->InsertObject(object, m_Scene->Objects().empty() ? nullptr : m_Scene->Objects().back().get());
    };
    append(Image("disc", "demo_disc", {70, 80}, {96, 96}));
    append(Image("stone", "demo_stone", {120, 90}, {70, 70}));
    append(Image("spinner", "demo_spinner", {205, 45}, {56, 56}, 0.3f));
    m_Lamp.reset(new qe::CSceneGroup());
    m_Lamp->SetId("lamp");
    qe::ImageObjectPtrT on = Image("lamp_on", "demo_disc", {205, 120}, {44, 44});
    qe::ImageObjectPtrT off = Image("lamp_off", "demo_disc", {205, 120}, {36, 36});
    on->SetColor(Color(0xFFFFE060u));
    off->SetColor(Color(0xFF606060u));
    off->RaiseObjectFlag(qe::CBaseSceneObject::ObjectFlagHidden);
    m_Lamp->InsertChild(on, nullptr);
    m_Lamp->InsertChild(off, on.get());
    append(m_Lamp);
    qe::ClipObjectPtrT orbit = Placed(new qe::CClipObject(), "orbit", {150, 40}, {64, 64});
    orbit->SetClipId("demo_orbit");
    orbit->UseAlpha(true);
    append(orbit);
    qe::AreaPtrT door(new qe::CArea());
    door->SetId("door");
    for (FloatVector p : {FloatVector(8, 152), FloatVector(30, 112), FloatVector(52, 152)})
        door->InsertPoint(qe::AreaPointPtrT(new qe::CAreaPoint(p)), door->Points().empty() ? nullptr : door->Points().back().get());
    m_Scene->InsertArea(door, nullptr);
    m_Scene->UpdateTotalChildList();
}

void CDemoQuestScene::Update(unsigned timeMs)
{
    if (!m_Scene)
        return;
    m_Lamp->SetCurrent((timeMs / 1500) % 2 ? "lamp_off" : "lamp_on", false, 0, nullptr);
    m_Scene->UpdateGame();
    const float a = timeMs / 1000.0f;
    m_Probe = {125 + 105 * std::cos(a * 0.7f), 80 + 65 * std::sin(a * 1.1f)};
    m_Hit = m_Scene->GetObjectAt(m_Probe, &core::CTextureManager::Instance().GetTexturesAlpha());
}

void CDemoQuestScene::Draw(graphics::CRenderer& r)
{
    if (!m_Scene)
        return;
    r.PushState();
    r.ApplyMatrix(misc::MatrixTranslation(kQuestFrame.X, kQuestFrame.Y));
    const FloatRect inside(0, 0, kQuestFrame.Width, kQuestFrame.Height);
    r.SetClipPoly(misc::RectToPoly4(inside));
    r.RenderFilledPoly4(misc::RectToPoly4(inside), Color(0xFF101418u));
    m_Scene->DrawGame(&r);
    const Color mark(m_Hit ? 0xFF40FF40u : 0xFFFF4040u);
    if (m_Hit && m_Hit->GetType() == qe::CBaseSceneObject::ObjectType && m_Hit->GetSize().X != 0) {
        const misc::Poly4 outline = m_Hit->GetPoly();
        for (int i = 0; i < 4; ++i)
            r.RenderLine(outline[i], outline[(i + 1) % 4], mark);
    }
    r.RenderLine(m_Probe - FloatVector(6, 0), m_Probe + FloatVector(6, 0), mark);
    r.RenderLine(m_Probe - FloatVector(0, 6), m_Probe + FloatVector(0, 6), mark);
    r.RenderRect(inside, Color(0xFFF0C040u));
    r.PopState();
}

} // namespace k17

#include "game/Branch.h"

#include "core/TextureManager.h"
#include "diag/Log.h"
#include "game/GameClock.h"
#include "graphics/Renderer.h"
#include "gui/GuiServices.h"
#include "misc/GamePack.h"
#include "misc/Unicode.h"
#include "misc/imagelib/ImageLib.h"
#include "misc/sys/Path.h"

#include <algorithm>
#include <cmath>
#include <cstring>

namespace k17 {

using namespace ox;

CBranch::CBranch(const wstring& gameFolder) : CWidget("branch", gui::LayerTop, 0), m_Image(new gui::CImageWidget())
{
    AddWidget(m_Image);
    for (const char16_t* name : {u"fsdata/splash2.jpg", u"fsdata/splash1.jpg"}) {
        const wstring path = misc::sys::AppendPath(gameFolder, name);
        if (misc::sys::CheckExistPath(path))
            AddPicture(misc::WideToUtf8(path).c_str());
    }
    for (int i = 1; i <= 5; ++i) {
        const std::string path = "branch/logo" + std::to_string(i) + ".jpg";
        if (misc::g_GamePack::Instance().Access(path.c_str()))
            AddPicture(path.c_str());
    }
    ShowNext();
}

// A picture of more than 2 x 2 pixels becomes an item on a surface of its own. Absolute
// paths are files on disk; the others are read through the game pack.
void CBranch::AddPicture(const char* path)
{
    misc::imagelib::Image image;
    if (path[0] == '/') {
        std::string error;
        if (!misc::imagelib::DecodeImageOnDisk(path, image, error))
            OX_LOG("game", diag::LogWarning, "%s", error.c_str());
    } else {
        misc::imagelib::CJPEGDecoder decoder;
        decoder.SetName(path);
        decoder.DecodeFromFile(path, image);
    }
    if (image.width <= 2 || image.height <= 2) {
        OX_LOG("game", diag::LogInfo, "start-up picture %s left out (%ux%u)", path, image.width, image.height);
        return;
    }
    graphics::CSurface* surface = core::CTextureManager::Instance().CreateSurface(image.width, image.height);
    OX_CHECK_DATA(surface != nullptr);
    surface->CreateBuffer();
    std::memcpy(surface->GetBuffer(), image.pixels.data(), image.pixels.size() * sizeof(uint32_t));
    surface->CommitBits();
    surface->DropBuffer();
    Item item;
    item.m_Surface = surface;
    item.m_Texture = std::make_shared<graphics::CTexture>(surface);
    m_Items.push_back(std::move(item));
}

void CBranch::ShowNext()
{
    while (!m_Items.empty()) {
        const Item& item = m_Items.front();
        m_Image->SetImage(item.m_Texture.get());
        m_Image->SetColor(graphics::Color(0u));
        if (!item.m_Texture || item.m_Texture->GetWidth() <= 2) {
            m_Items.pop_front();
            continue;
        }
        // Fitted to the canvas without distortion, centred on it.
        const misc::FloatVector canvas = gui::GetGuiServices().canvas;
        const float w = item.m_Texture->GetWidth(), h = item.m_Texture->GetHeight();
        const float scale = std::min(canvas.X / w, canvas.Y / h);
        m_Image->SetSize(w * scale, h * scale);
        m_Image->SetOffset((canvas.X - w * scale) / 2, (canvas.Y - h * scale) / 2);
        m_StartTime = static_cast<float>(GetGameClock());
        return;
    }
}

void CBranch::DoUpdate()
{
    if (m_Done)
        return;
    Cover();
    if (m_Items.empty()) {
        m_Image->SetColor(graphics::Color(0u));
        m_Image->SetImage(static_cast<const graphics::CTexture*>(nullptr));
        AddFlags(gui::FlagHidden | gui::FlagDisabled);
        m_Done = true;
        return;
    }
    const Item& item = m_Items.front();
    const float t = static_cast<float>(GetGameClock()) - m_StartTime;
    if (t >= static_cast<float>(item.m_Duration)) {
        m_Items.pop_front();
        ShowNext();
        return;
    }
    float alpha = 255.0f;
    if (t < item.m_Fade)
        alpha = t * 255.0f / item.m_Fade;
    else if (t > item.m_Duration - item.m_Fade)
        alpha = 255.0f - (t - (item.m_Duration - item.m_Fade)) * 255.0f / item.m_Fade;
    const auto a = static_cast<uint32_t>(std::clamp(std::lround(alpha), 0L, 255L));
    m_Image->SetColor(graphics::Color(a << 24 | 0xFFFFFFu));
}

void CBranch::DoDraw(graphics::CRenderer& renderer)
{
    // The load window stays transparent while the pictures run: they are drawn as they are.
    if (!m_Done)
        renderer.SetColor(graphics::Color(0xFFFFFFFFu));
    CWidget::DoDraw(renderer);
}

void CBranch::SetParentWidget(gui::CBaseWidget* parent)
{
    CWidget::SetParentWidget(parent);
    Cover();
}

// The pictures are placed on the canvas: the widget covers it from its top-left corner,
// wherever its window stands (a full-screen window puts it at its own (0, 0)).
void CBranch::Cover()
{
    const gui::CBaseWidget* parent = GetParentWidget();
    if (!parent)
        return;
    const misc::FloatVector at = parent->GetAbsPos(false);
    const misc::FloatVector canvas = gui::GetGuiServices().canvas;
    SetOffset(-at.X, -at.Y);
    if (GetSize().X != canvas.X || GetSize().Y != canvas.Y)
        SetSize(canvas.X, canvas.Y);
}

} // namespace k17

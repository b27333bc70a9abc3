#include "gui/Cursor.h"

#include "diag/Log.h"
#include "graphics/Renderer.h"
#include "gui/GuiServices.h"

#include <algorithm>

namespace ox::gui {

namespace {

constexpr const char* kCursorTextures[] = {"gui_cursors_pointer", "gui_cursors_hand", "gui_cursors_text",
                                           "gui_cursors_hourglass"};

bool IsActive()
{
    const auto& active = GetGuiServices().isActive;
    return !active || active();
}

} // namespace

CCursor& CCursor::Instance()
{
    static auto* cursor = new CCursor();
    return *cursor;
}

void CCursor::SetPosition(const misc::FloatVector& position)
{
    if (!m_Hidden)
        m_Type = CursorPointer;
    m_Position = position;
}

void CCursor::SetCursor(int type)
{
    if (type < CursorPointer || type > CursorNone) {
        OX_LOG("gui", diag::LogWarning, "SetCursor: no cursor type %d, ignored", type);
        return;
    }
    m_Type = type;
}

void CCursor::SetCustomCursor(graphics::CImage* image)
{
    m_CustomImage = image;
    m_Type = CursorCustom;
}

void CCursor::EnableCustomCursors(bool enable)
{
    m_CustomEnabled = enable;
    if (enable)
        LoadImages();
}

void CCursor::LoadImages()
{
    m_Images.clear();
    for (int type = CursorPointer; type <= CursorHourglass; ++type) {
        auto image = std::make_unique<graphics::CImage>();
        image->SetTexture(kCursorTextures[type]);
        if (image->HasTexture())
            m_Images[type] = std::move(image);
        else
            OX_LOG("gui", diag::LogInfo, "no cursor texture %s: the platform's pointer stands in",
                   kCursorTextures[type]);
    }
}

void CCursor::SetActiveRect(const misc::FloatRect& rect, const misc::FloatVector& scale)
{
    m_ActiveRect = rect;
    m_Scale = scale;
}

void CCursor::ShowSystemPointer(int type)
{
    core::CSystemIntegration* platform = GetGuiServices().platform;
    if (!platform)
        return;
    const bool show = !m_Hidden && type != CursorNone;
    const unsigned shape = type < CursorCustom ? static_cast<unsigned>(type) : static_cast<unsigned>(CursorPointer);
    if (show && (!platform->IsCursorVisible() || platform->GetCursorType() != shape))
        platform->SetCursorType(shape, true);
    else if (!show && platform->IsCursorVisible())
        platform->ShowCursor(false);
}

void CCursor::Refresh()
{
    m_CurrentCursorImage = nullptr;
    if (m_CustomEnabled) {
        if (m_Type == CursorCustom && m_CustomImage) {
            m_CurrentCursorImage = m_CustomImage;
        } else {
            auto found = m_Images.find(m_Type == CursorCustom ? CursorPointer : m_Type);
            m_CurrentCursorImage = found != m_Images.end() ? found->second.get() : nullptr;
        }
    }
    if (!m_CurrentCursorImage) {
        ShowSystemPointer(m_Type);
        return;
    }
    if (core::CSystemIntegration* platform = GetGuiServices().platform; platform && IsActive() &&
                                                                         platform->IsCursorVisible())
        platform->ShowCursor(false);
}

void CCursor::Draw(graphics::CRenderer& renderer)
{
    core::CSystemIntegration* platform = GetGuiServices().platform;
    if (!m_CustomEnabled || !m_CurrentCursorImage || m_Hidden || !platform)
        return;
    misc::IntVector pointer = platform->GetCursorPos();
    platform->ScreenToClient(pointer);
    const float x = static_cast<float>(pointer.X), y = static_cast<float>(pointer.Y);
    const misc::FloatRect& r = m_ActiveRect;
    const auto& fullscreen = GetGuiServices().isFullscreen;
    const bool inside = x >= r.X && y >= r.Y && x < r.X + r.Width && y < r.Y + r.Height;
    if (!inside && !(fullscreen && fullscreen()))
        return;
    const float cx = (std::clamp(x, r.X, std::max(r.X, r.X + r.Width - 1)) - r.X) / m_Scale.X;
    const float cy = (std::clamp(y, r.Y, std::max(r.Y, r.Y + r.Height - 1)) - r.Y) / m_Scale.Y;
    const misc::FloatVector size = m_CurrentCursorImage->GetTextureSize();
    m_CurrentCursorImage->Draw(renderer, cx - size.X / 2, cy - size.Y / 2);
}

} // namespace ox::gui

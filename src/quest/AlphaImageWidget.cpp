#include "quest/AlphaImageWidget.h"

#include "core/TextureManager.h"
#include "gui/WidgetFactory.h"
#include "quest/PixelTest.h"

#include <cmath>

namespace qe {

using namespace ox;

CAlphaImageWidget::CAlphaImageWidget() { RemFlags(gui::FlagDisabled); }

void CAlphaImageWidget::Load(const core::CSettingsGroup& node, const core::CSettingsGroup& templates)
{
    CImageWidget::Load(node, templates);
    const graphics::CTexture* texture = GetImage().GetTexture();
    if (texture && !texture->SurfaceIsBuffer())
        const_cast<graphics::CTexture*>(texture)->CreateBuffer();
}

bool CAlphaImageWidget::IsOpaqueAt(const IntVector& pos) const
{
    const graphics::CTexture* texture = GetImage().GetTexture();
    const misc::FloatRect& rect = GetImageRect();
    if (!texture || rect.Width <= 0 || rect.Height <= 0)
        return false;
    const int x = static_cast<int>(std::floor((pos.X - rect.X) * texture->GetWidth() / rect.Width));
    const int y = static_cast<int>(std::floor((pos.Y - rect.Y) * texture->GetHeight() / rect.Height));
    core::CTextureManager& manager = core::CTextureManager::Instance();
    const char* id = manager.GetItemId(texture);
    return IsSolidPixel(*texture, id ? id : "", x, y, -1, &manager.GetTexturesAlpha());
}

bool CAlphaImageWidget::OnMouseMove(const IntVector& pos, int keys, bool broadcast)
{
    CImageWidget::OnMouseMove(pos, keys, broadcast);
    if (broadcast || !IsOpaqueAt(pos))
        return false;
    if (CBaseWidget* parent = GetParentWidget())
        parent->OnChildAction("mouse_move", this);
    return true;
}

bool CAlphaImageWidget::OnMouseDown(const IntVector& pos, gui::MouseButtons /*button*/, int /*keys*/, bool broadcast)
{
    return !broadcast && IsOpaqueAt(pos);
}

bool CAlphaImageWidget::OnMouseUp(const IntVector& pos, gui::MouseButtons /*button*/, int /*keys*/, bool broadcast)
{
    return !broadcast && IsOpaqueAt(pos);
}

void RegisterAlphaImageWidget(gui::CWidgetFactory& factory)
{
    factory.RegisterWidget<CAlphaImageWidget>("alpha_image_widget");
}

} // namespace qe

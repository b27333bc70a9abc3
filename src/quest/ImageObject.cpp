#include "quest/ImageObject.h"

#include "core/TexturesAlpha.h"
#include "diag/Log.h"
#include "graphics/Renderer.h"

#include <cmath>

namespace qe {

namespace {

constexpr const char* kChannel = "quest";

} // namespace

void CImageObject::SetTextureId(const std::string& id)
{
    m_TextureId = id;
    m_Reported = false;
    m_Image.Init();
    m_Image.SetTexture(id.c_str());
    m_NativeSize = m_Image.GetTextureSize();
    if (!m_Image.HasTexture())
        OX_LOG(kChannel, ox::diag::LogError, "Image '%s': no texture '%s'; it draws nothing and takes no click",
               GetIdRef().c_str(), id.c_str());
}

unsigned CImageObject::GetTotalTime() const
{
    const ox::graphics::CTexture* texture = m_Image.GetTexture();
    return texture ? texture->GetAnimTime() : 0;
}

void CImageObject::Draw(ox::graphics::CRenderer* renderer)
{
    if (m_NativeSize.X == 0 || m_NativeSize.Y == 0)
        return;
    // The picture at its native size moved by half of it and scaled to the shown size is
    // this rectangle.
    m_Image.Draw(*renderer, {-m_Size.X / 2, -m_Size.Y / 2, m_Size.X, m_Size.Y});
}

bool CImageObject::IsContains(const FloatVector& point, const ox::core::CTexturesAlpha* masks) const
{
    if (!IsInContour(point))
        return false;
    const ox::graphics::CTexture* texture = m_Image.GetTexture();
    if (!texture) {
        if (!m_Reported)
            OX_LOG(kChannel, ox::diag::LogWarning, "Error using texture tex_id=%s (image '%s')", m_TextureId.c_str(),
                   GetIdRef().c_str());
        m_Reported = true;
        return false;
    }
    const FloatVector pixel = ToPicture(point);
    const int x = static_cast<int>(std::floor(pixel.X)), y = static_cast<int>(std::floor(pixel.Y));
    if (const ox::core::TextureAlphaDesc* mask = m_Mask.Find(masks, m_TextureId))
        return masks->IsOpaque(*mask, x, y);
    return IsSolidPixel(*texture, nullptr, nullptr, x, y, m_Image.GetCurrentFrame());
}

BaseSceneObjectPtrT CImageObject::Clone() const
{
    boost::intrusive_ptr<CImageObject> clone(new CImageObject());
    CopyTo(*clone);
    clone->m_TextureId = m_TextureId;
    if (m_Image.HasTexture()) {
        clone->m_Image.SetTexture(m_Image.GetTexture());
        clone->m_Image.SetTime(GetAnimTime());
    }
    return clone;
}

} // namespace qe

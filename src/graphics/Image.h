#pragma once
// What a widget or a scene object draws: a texture in a rectangle, with a transformation,
// a scale, a colour and, for an animated texture, the timer that picks its frame.
#include "core/TimeManager.h"
#include "graphics/Color.h"
#include "graphics/Texture.h"
#include "misc/Matrix.h"
#include "misc/Rect.h"
#include "misc/Vector.h"

#include <functional>
#include <memory>

namespace ox::graphics {

class CRenderer;

class CImage : public core::CTimerWrapper {
public:
    enum Flags : uint8_t { FlagBoxImage = 1, FlagIntDest = 2 };
    // The texture of a declared id, or null.
    using TextureLookup = std::function<const CTexture*(const char* id)>;

    // How every image finds a texture by id; set by whoever holds the declared textures.
    static void SetTextureLookup(TextureLookup lookup);

    CImage() = default;
    explicit CImage(const CTexture* texture) { Init(texture); }

    // Sets the texture (with a fresh timer) and puts every setting back: identity
    // transformation, scale 1, white, an empty rectangle (the frame size), no flags.
    void Init(const CTexture* texture = nullptr);
    // With reset, an animated texture starts again at time 0 and speed 1; without, a timer
    // is only made when an animated texture has none. Null drops the texture.
    void SetTexture(const CTexture* texture, bool reset = true);
    // By declared id, through the look-up; an unknown id (or no look-up) drops the texture.
    void SetTexture(const char* id, bool reset = true);
    const CTexture* GetTexture() const { return HasTexture() ? &m_Texture : nullptr; }
    bool HasTexture() const { return m_Texture.GetData() != nullptr; }
    // The frame size in pixels.
    misc::FloatVector GetTextureSize() const;

    void Draw(CRenderer& renderer);
    void Draw(CRenderer& renderer, float x, float y);
    void Draw(CRenderer& renderer, const misc::FloatRect& rect);
    void DrawTransformed(CRenderer& renderer, const misc::FloatMatrix& matrix);
    void DrawTransformed(CRenderer& renderer, const misc::FloatRect& rect, const misc::FloatMatrix& matrix);

    // A width or height of 0 takes the frame's.
    void SetRect(const misc::FloatRect& rect);
    const misc::FloatRect& GetRect() const { return m_Rect; }
    // Surface pixels to draw instead of a frame; ignored for an animated image, a negative
    // width or height removes it.
    void SetSourceRect(const misc::IntRect& rect);
    // The one set, or the first part in surface pixels.
    misc::IntRect GetSourceRect() const;
    bool HasSourceRect() const { return m_SourceRect != nullptr; }
    void SetTransformationMatrix(const misc::FloatMatrix& matrix) { m_Matrix = matrix; }
    const misc::FloatMatrix& GetTransformationMatrix() const { return m_Matrix; }
    void SetScale(float scale) { m_Scale = scale; }
    float GetScale() const { return m_Scale; }
    void SetColor(const Color& color) { m_Color = color; }
    const Color& GetColor() const { return m_Color; }
    void SetFlags(uint8_t flags) { m_Flags = flags; }
    uint8_t GetFlags() const { return m_Flags; }

    bool IsAnimated() const { return HasTexture() && m_Texture.IsAnimated(); }
    unsigned GetFrameCount() const { return HasTexture() ? m_Texture.EnumFrames() : 0; }
    // The frame the timer shows now (-1: none, drawn as the first part).
    int GetCurrentFrame() const;
    void PauseAnimation(bool pause);
    // A whole number; 1 without a timer.
    void SetAnimationK(float k);
    float GetAnimationK() const;
    // Moves the timer to where frame-map entry `frame` starts.
    void SetFrame(unsigned frame);
    void SetTime(unsigned ms);
    unsigned GetTime() const;

private:
    void ResetTimer(bool reset);

    CTexture m_Texture;
    misc::FloatRect m_Rect;
    std::unique_ptr<misc::ShortRect> m_SourceRect;
    misc::FloatMatrix m_Matrix;
    float m_Scale = 1.0f;
    Color m_Color;
    uint8_t m_Flags = 0;
};

} // namespace ox::graphics

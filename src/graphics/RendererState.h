#pragma once
// The per-frame render state: stacks of matrix, colour, clip polygon, blend mode and pixel
// shader, the aspect matrix of the window, and the software clipper that cuts vertices to
// the current clip polygon. Pure logic, no device.
#include "diag/Assert.h"
#include "graphics/Color.h"
#include "graphics/RenderBackend.h"
#include "misc/Matrix.h"
#include "misc/Poly.h"

namespace ox::graphics {

class CPixelShader;

enum BlendModes : uint32_t { BlendNone = 1, BlendNormal = 2, BlendAdditive = 3 };

// A stack of at most MaxSize entries; Top is -1 when empty.
template <class T, int MaxSize = 32>
class BoundedStack {
public:
    void Push(const T& value)
    {
        OX_ASSERT(Top>=-1 && Top<MaxSize-1);
        if (Top < MaxSize - 1)
            m_Items[++Top] = value;
    }
    void Pop()
    {
        OX_ASSERT(Top>=-1);
        if (Top >= 0)
            --Top;
    }
    T& GetTop()
    {
        OX_ASSERT(Top>=0 && Top<MaxSize-1);
        return m_Items[Top < 0 ? 0 : Top];
    }
    const T& GetTop() const { return const_cast<BoundedStack*>(this)->GetTop(); }
    bool Empty() const { return Top < 0; }
    int Size() const { return Top + 1; }
    void Clear() { Top = -1; }

private:
    T m_Items[MaxSize] {};
    int Top = -1;
};

// A fixed array of at most MaxSize entries.
template <class T, int MaxSize>
class Array {
public:
    void PushBack(const T& value)
    {
        OX_ASSERT(Top>=-1 && Top<MaxSize-1);
        if (Top < MaxSize - 1)
            m_Items[++Top] = value;
    }
    T& operator[](size_t _num)
    {
        OX_ASSERT(_num <= size_t(Top));
        return m_Items[_num];
    }
    const T& operator[](size_t _num) const { return const_cast<Array&>(*this)[_num]; }
    T& Back()
    {
        OX_ASSERT(!Empty());
        return m_Items[Top < 0 ? 0 : Top];
    }
    size_t Size() const { return static_cast<size_t>(Top + 1); }
    bool Empty() const { return Top < 0; }
    void Clear() { Top = -1; }

private:
    T m_Items[MaxSize] {};
    int Top = -1;
};

// A clip polygon, in window pixels.
using ClipPolygon = Array<misc::Vector<float>, 12>;

// The most vertices one primitive may have before and after clipping.
constexpr unsigned MaxClipVertices = 64;

class CRendererState {
public:
    CRendererState();

    // Frame start: identity matrix, white, BlendNormal, no shader, no clip.
    void ResetFrame();

    void SetBlendMode(BlendModes mode) { m_BlendStack.GetTop() = mode; }
    BlendModes GetBlendMode() const { return m_BlendStack.GetTop(); }
    void SetColor(const Color& color) { m_ColorStack.GetTop() = color; }
    const Color& GetColor() const { return m_ColorStack.GetTop(); }
    void SetPixelShader(const CPixelShader* shader) { m_ShaderStack.GetTop() = shader; }
    const CPixelShader* GetPixelShader() const { return m_ShaderStack.GetTop(); }
    // top := m * top: m acts first on the vertices.
    void ApplyMatrix(const misc::FloatMatrix& m);
    const misc::FloatMatrix& GetMatrix() const { return m_MatrixStack.GetTop(); }

    // Intersects the clip with a quad given in the current coordinates.
    void SetClipPoly(const misc::Poly4& poly);
    // The clip in window pixels; null when there is none.
    const ClipPolygon* GetClipPoly() const { return m_ClipStack.Empty() ? nullptr : &m_ClipStack.GetTop(); }

    void PushState();
    void PopState();
    void PushMatrix() { m_MatrixStack.Push(m_MatrixStack.GetTop()); }
    void PopMatrix()
    {
        m_MatrixStack.Pop();
        m_TransformValid = false;
    }
    void PushBlendMode() { m_BlendStack.Push(m_BlendStack.GetTop()); }
    void PopBlendMode() { m_BlendStack.Pop(); }
    void PushColor() { m_ColorStack.Push(m_ColorStack.GetTop()); }
    void PopColor() { m_ColorStack.Pop(); }

    // The aspect matrix := scale * translate.
    void SetAspectMatrix(const misc::FloatVector& scale, const misc::FloatVector& offset);
    const misc::FloatMatrix& GetAspectMatrix() const { return m_AspectMatrix; }
    // The current matrix followed by the aspect matrix: source units to window pixels.
    const misc::FloatMatrix& GetTransform() const
    {
        if (!m_TransformValid) {
            m_Transform = m_MatrixStack.GetTop() * m_AspectMatrix;
            m_TransformValid = true;
        }
        return m_Transform;
    }

    // Matrix, aspect, clip (unless skipped) and the half-pixel shift, in place. `count` may
    // fall, to 0 when nothing is left; the buffer holds MaxClipVertices.
    void TransformVertices(Vertex* vertices, unsigned& count, bool skipClip) const;
    // Cuts a list of triangles (or one line of two vertices) to the clip polygon.
    void ClipVertices(Vertex* vertices, unsigned& count) const;
    // The steps after the transform: clip (unless skipped), then the half-pixel shift.
    void ClipAndShift(Vertex* vertices, unsigned& count, bool skipClip) const;

    // Sutherland-Hodgman: `subject` cut by the convex `clip`, into `out`.
    static void IntersectPolygons(const ClipPolygon& clip, const ClipPolygon& subject, ClipPolygon& out);

private:
    BoundedStack<misc::FloatMatrix> m_MatrixStack;
    BoundedStack<Color> m_ColorStack;
    BoundedStack<ClipPolygon> m_ClipStack;
    BoundedStack<BlendModes> m_BlendStack;
    BoundedStack<const CPixelShader*> m_ShaderStack;
    misc::FloatMatrix m_AspectMatrix;
    mutable misc::FloatMatrix m_Transform;
    mutable bool m_TransformValid = false;
};

} // namespace ox::graphics

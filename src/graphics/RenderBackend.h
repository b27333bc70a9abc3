#pragma once
// The graphics device as the render logic sees it: a small set of operations with the
// meaning, numbering and result codes of the original fixed-function device. Everything
// above it (state stacks, clipping, batching, state shadowing) is plain logic; a backend
// only carries the operations out (OpenGL in the game, a recorder in the tests).
#include "misc/Rect.h"

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

namespace ox::graphics {

struct Resolution {
    unsigned Width = 0;
    unsigned Height = 0;
    bool Bpp32 = true;
    bool operator==(const Resolution& o) const { return Width == o.Width && Height == o.Height && Bpp32 == o.Bpp32; }
};
using ResolutionsT = std::vector<Resolution>;

// The pre-transformed vertex: window pixel position (pixel centres on whole numbers), colours
// as A8R8G8B8 words, one texture coordinate pair.
struct Vertex {
    float x, y, z, rhw;
    uint32_t diffuse;
    uint32_t specular;
    float u, v;
};
static_assert(sizeof(Vertex) == 32);

// The vertex format code of Vertex: position with rhw, diffuse, specular, one texture set.
constexpr uint32_t VertexFormatCode = 452;

enum PrimitiveType : uint32_t {
    PrimitivePointList = 1,
    PrimitiveLineList = 2,
    PrimitiveLineStrip = 3,
    PrimitiveTriangleList = 4,
    PrimitiveTriangleStrip = 5,
    PrimitiveTriangleFan = 6,
};

// Result codes: negative is a failure.
using DeviceResult = int32_t;
constexpr DeviceResult ResultOk = 0;
constexpr DeviceResult ResultFail = static_cast<DeviceResult>(0x80004005);
constexpr DeviceResult ResultOutOfVideoMemory = static_cast<DeviceResult>(0x8876017C);
constexpr DeviceResult ResultDeviceLost = static_cast<DeviceResult>(0x88760868);
constexpr DeviceResult ResultDeviceNotReset = static_cast<DeviceResult>(0x88760869);
constexpr DeviceResult ResultNotAvailable = static_cast<DeviceResult>(0x8876086A);
constexpr DeviceResult ResultInvalidCall = static_cast<DeviceResult>(0x8876086C);

// Render states and their values, by the device's numbers.
enum RenderStateType : uint32_t {
    RsZEnable = 7,
    RsZWriteEnable = 14,
    RsSrcBlend = 19,
    RsDestBlend = 20,
    RsCullMode = 22,
    RsDitherEnable = 26,
    RsAlphaBlendEnable = 27,
    RsSpecularEnable = 29,
    RsClipping = 136,
    RsLighting = 137,
};
enum BlendFactor : uint32_t { BlendFactorZero = 1, BlendFactorOne = 2, BlendFactorSrcAlpha = 5, BlendFactorInvSrcAlpha = 6 };
constexpr uint32_t CullNone = 1;

// Texture stage states (stage numbering) and sampler states.
enum TextureStageStateType : uint32_t {
    TssColorOp = 1,
    TssColorArg1 = 2,
    TssColorArg2 = 3,
    TssAlphaOp = 4,
    TssAlphaArg1 = 5,
    TssAlphaArg2 = 6,
    TssTexCoordIndex = 11,
    TssAddressU = 13,
    TssAddressV = 14,
    TssMagFilter = 16,
    TssMinFilter = 17,
    TssMipFilter = 18,
};
enum SamplerStateType : uint32_t {
    SampAddressU = 1,
    SampAddressV = 2,
    SampMagFilter = 5,
    SampMinFilter = 6,
    SampMipFilter = 7,
};
enum TextureOp : uint32_t { TopDisable = 1, TopSelectArg1 = 2, TopSelectArg2 = 3, TopModulate = 4 };
enum TextureArg : uint32_t { TaDiffuse = 0, TaCurrent = 1, TaTexture = 2 };
enum TextureAddress : uint32_t { TAddressWrap = 1, TAddressMirror = 2, TAddressClamp = 3, TAddressBorder = 4 };
enum TextureFilter : uint32_t { TexfNone = 0, TexfPoint = 1, TexfLinear = 2 };

// Surface formats by the numbers of the texture data (the device format is in brackets).
enum InternalFormat : uint8_t {
    FormatA8R8G8B8 = 1,  // 32 bits
    FormatA4R4G4B4 = 3,  // 16 bits
    FormatR5G6B5 = 5,    // 16 bits
    FormatA1R5G5B5 = 6,  // 16 bits
    FormatDXT1 = 11,     // 4 bits, blocks of 4 x 4
    FormatDXT3 = 13,     // 8 bits
    FormatDXT5 = 15,     // 8 bits
};
// The formats a device texture can have.
constexpr bool IsDeviceFormat(uint8_t format)
{
    return format == FormatA8R8G8B8 || format == FormatA4R4G4B4 || format == FormatR5G6B5 ||
           format == FormatA1R5G5B5 || format == FormatDXT1 || format == FormatDXT3 || format == FormatDXT5;
}
// Bits per pixel by internal format (16 entries).
constexpr unsigned FormatBitsPerPixel(uint8_t format)
{
    constexpr unsigned table[16] = {0, 32, 32, 16, 16, 16, 16, 16, 4, 2, 4, 4, 8, 8, 8, 8};
    return format < 16 ? table[format] : 0;
}

// A texture of the device. Backends derive their own.
struct CDeviceTexture {
    virtual ~CDeviceTexture() = default;
    unsigned Width = 0;
    unsigned Height = 0;
    uint8_t Format = FormatA8R8G8B8;
    bool RenderTarget = false;
};

// A compiled pixel shader of the device.
struct CDeviceShader {
    virtual ~CDeviceShader() = default;
};

class IRenderBackend {
public:
    virtual ~IRenderBackend() = default;

    // The device for a window (an SDL_Window*, or null where the backend needs none).
    virtual DeviceResult CreateDevice(void* window, unsigned width, unsigned height, bool fullscreen) = 0;
    // A new back-buffer size or mode for the existing device.
    virtual DeviceResult ResetDevice(unsigned width, unsigned height, bool fullscreen) = 0;
    virtual bool HasDevice() const = 0;
    // For a reset only the kept back-buffer reference goes; otherwise the device itself.
    virtual void ReleaseDevice(bool forReset) = 0;
    // Ok, ResultDeviceLost (wait) or ResultDeviceNotReset (reset now).
    virtual DeviceResult TestCooperativeLevel() = 0;
    // The display modes of the first adapter, unfiltered.
    virtual void EnumModes(ResolutionsT& out) = 0;

    virtual DeviceResult BeginScene() = 0;
    virtual DeviceResult EndScene() = 0;
    virtual DeviceResult Present() = 0;
    // Clears the current target, whole.
    virtual void Clear(uint32_t argb) = 0;
    // An end-of-frame event: made and issued; polled; released. False: none available.
    virtual bool CreateEventQuery() = 0;
    virtual bool PollEventQuery() = 0;
    virtual void ReleaseEventQuery() = 0;

    virtual void SetRenderState(uint32_t state, uint32_t value) = 0;
    virtual void SetTextureStageState(unsigned stage, uint32_t state, uint32_t value) = 0;
    virtual void SetSamplerState(unsigned stage, uint32_t state, uint32_t value) = 0;
    virtual void SetTexture(unsigned stage, CDeviceTexture* texture) = 0;
    // A render-target texture, or null for the back buffer.
    virtual DeviceResult SetRenderTarget(CDeviceTexture* target) = 0;
    virtual void SetPixelShader(CDeviceShader* shader) = 0;
    virtual DeviceResult DrawPrimitiveUP(PrimitiveType type, unsigned primitiveCount, const Vertex* vertices,
                                         unsigned vertexCount) = 0;

    // Null on failure.
    virtual CDeviceTexture* CreateTexture(unsigned width, unsigned height, uint8_t format, bool renderTarget) = 0;
    virtual void ReleaseTexture(CDeviceTexture* texture) = 0;
    // Replaces the whole level 0 with tightly packed rows (for block formats: rows of blocks).
    virtual DeviceResult LoadBits(CDeviceTexture* texture, const void* data, size_t size) = 0;
    // Reads level 0 as top-down 0xAARRGGBB words.
    virtual DeviceResult ReadTexture(CDeviceTexture* texture, uint32_t* out) = 0;
    // Reads an area of the back buffer (window pixels) as top-down 0xAARRGGBB words.
    virtual DeviceResult ReadBackBuffer(const misc::IntRect& area, uint32_t* out) = 0;

    // Compiles a pixel shader; null with the compiler's messages in `errors`.
    virtual CDeviceShader* CreatePixelShader(const std::string& source, std::string& errors) = 0;
    virtual void ReleasePixelShader(CDeviceShader* shader) = 0;
};

// Logs a failed result on channel "graphics" as "<what> failed, result: <hex>" and
// returns true for a failure.
bool CheckResult(DeviceResult result, const char* what, int level);

} // namespace ox::graphics

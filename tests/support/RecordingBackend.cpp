#include "support/RecordingBackend.h"

#include <cstring>

namespace oxtest {

using namespace ox::graphics;

namespace {

std::string Name(const CDeviceTexture* texture)
{
    return texture ? "tex" + std::to_string(static_cast<const RecordingBackend::Texture*>(texture)->id) : "null";
}

} // namespace

RecordingBackend::~RecordingBackend() = default;

std::vector<std::string> RecordingBackend::Calls(const std::string& prefix) const
{
    std::vector<std::string> out;
    for (const std::string& call : calls)
        if (call.compare(0, prefix.size(), prefix) == 0)
            out.push_back(call);
    return out;
}

DeviceResult RecordingBackend::CreateDevice(void*, unsigned w, unsigned h, bool fullscreen)
{
    Record("CreateDevice " + std::to_string(w) + " " + std::to_string(h) + " " + std::to_string(fullscreen));
    if (hasDevice)
        return ResetDevice(w, h, fullscreen);
    if (createResult < 0)
        return createResult;
    ++creates;
    hasDevice = true;
    width = w;
    height = h;
    backBuffer.assign(static_cast<size_t>(w) * h, 0);
    return ResultOk;
}

DeviceResult RecordingBackend::ResetDevice(unsigned w, unsigned h, bool fullscreen)
{
    Record("ResetDevice " + std::to_string(w) + " " + std::to_string(h) + " " + std::to_string(fullscreen));
    if (resetResult < 0)
        return resetResult;
    ++resets;
    width = w;
    height = h;
    backBuffer.assign(static_cast<size_t>(w) * h, 0);
    return ResultOk;
}

void RecordingBackend::ReleaseDevice(bool forReset)
{
    Record(std::string("ReleaseDevice ") + (forReset ? "reset" : "all"));
    if (!forReset && hasDevice) {
        ++releases;
        hasDevice = false;
    }
}

DeviceResult RecordingBackend::TestCooperativeLevel() { return cooperativeLevel; }

void RecordingBackend::EnumModes(ResolutionsT& out) { out.insert(out.end(), modes.begin(), modes.end()); }

DeviceResult RecordingBackend::BeginScene()
{
    Record("BeginScene");
    return beginSceneResult;
}

DeviceResult RecordingBackend::EndScene()
{
    Record("EndScene");
    return ResultOk;
}

DeviceResult RecordingBackend::Present()
{
    Record("Present");
    return presentResult;
}

void RecordingBackend::Clear(uint32_t argb)
{
    char text[32];
    snprintf(text, sizeof text, "Clear %08X", argb);
    Record(text);
    if (!target)
        std::fill(backBuffer.begin(), backBuffer.end(), argb);
}

bool RecordingBackend::CreateEventQuery()
{
    Record("CreateEventQuery");
    m_Query = queryAvailable;
    return m_Query;
}

bool RecordingBackend::PollEventQuery()
{
    ++queryPolls;
    return queryPolls % 3 == 0; // busy twice, then done
}

void RecordingBackend::ReleaseEventQuery()
{
    Record("ReleaseEventQuery");
    m_Query = false;
}

void RecordingBackend::SetRenderState(uint32_t state, uint32_t value)
{
    Record("SetRenderState " + std::to_string(state) + " " + std::to_string(value));
    if (state == RsSrcBlend)
        srcBlend = value;
    if (state == RsDestBlend)
        destBlend = value;
}

void RecordingBackend::SetTextureStageState(unsigned stage, uint32_t state, uint32_t value)
{
    Record("SetTextureStageState " + std::to_string(stage) + " " + std::to_string(state) + " " +
           std::to_string(value));
}

void RecordingBackend::SetSamplerState(unsigned stage, uint32_t state, uint32_t value)
{
    Record("SetSamplerState " + std::to_string(stage) + " " + std::to_string(state) + " " + std::to_string(value));
}

void RecordingBackend::SetTexture(unsigned stage, CDeviceTexture* texture)
{
    Record("SetTexture " + std::to_string(stage) + " " + Name(texture));
    if (stage < 2)
        stageTexture[stage] = texture;
}

DeviceResult RecordingBackend::SetRenderTarget(CDeviceTexture* t)
{
    Record("SetRenderTarget " + Name(t));
    target = t;
    return ResultOk;
}

void RecordingBackend::SetPixelShader(CDeviceShader* s)
{
    Record(std::string("SetPixelShader ") + (s ? "shader" : "null"));
    shader = s;
}

DeviceResult RecordingBackend::DrawPrimitiveUP(PrimitiveType type, unsigned primitiveCount, const Vertex* vertices,
                                               unsigned vertexCount)
{
    Record("DrawPrimitiveUP " + std::to_string(type) + " " + std::to_string(primitiveCount) + " " +
           std::to_string(vertexCount));
    draws.push_back({type, primitiveCount, std::vector<Vertex>(vertices, vertices + vertexCount), stageTexture[0],
                     target, shader, srcBlend, destBlend});
    return ResultOk;
}

CDeviceTexture* RecordingBackend::CreateTexture(unsigned w, unsigned h, uint8_t format, bool renderTarget)
{
    Record("CreateTexture " + std::to_string(w) + " " + std::to_string(h) + " " + std::to_string(format) + " " +
           std::to_string(renderTarget));
    if (failCreateTexture || !hasDevice || !IsDeviceFormat(format))
        return nullptr;
    auto* texture = new Texture();
    texture->id = m_NextTexture++;
    texture->Width = w;
    texture->Height = h;
    texture->Format = format;
    texture->RenderTarget = renderTarget;
    if (allocateBits)
        texture->bits.assign(static_cast<size_t>(FormatBitsPerPixel(format)) * w * h / 8, 0);
    ++liveTextures;
    return texture;
}

void RecordingBackend::ReleaseTexture(CDeviceTexture* texture)
{
    Record("ReleaseTexture " + Name(texture));
    if (!texture)
        return;
    --liveTextures;
    delete static_cast<Texture*>(texture);
}

DeviceResult RecordingBackend::LoadBits(CDeviceTexture* texture, const void* data, size_t size)
{
    Record("LoadBits " + Name(texture) + " " + std::to_string(size));
    auto* t = static_cast<Texture*>(texture);
    if (!t)
        return ResultInvalidCall;
    t->bits.assign(static_cast<const unsigned char*>(data), static_cast<const unsigned char*>(data) + size);
    return ResultOk;
}

DeviceResult RecordingBackend::ReadTexture(CDeviceTexture* texture, uint32_t* out)
{
    Record("ReadTexture " + Name(texture));
    auto* t = static_cast<Texture*>(texture);
    if (!t || t->Format != FormatA8R8G8B8)
        return ResultInvalidCall;
    std::memcpy(out, t->bits.data(), t->bits.size());
    return ResultOk;
}

DeviceResult RecordingBackend::ReadBackBuffer(const ox::misc::IntRect& area, uint32_t* out)
{
    Record("ReadBackBuffer " + std::to_string(area.X) + " " + std::to_string(area.Y) + " " +
           std::to_string(area.Width) + " " + std::to_string(area.Height));
    if (area.X < 0 || area.Y < 0 || area.X + area.Width > static_cast<int>(width) ||
        area.Y + area.Height > static_cast<int>(height))
        return ResultInvalidCall;
    for (int y = 0; y < area.Height; ++y)
        std::memcpy(out + static_cast<size_t>(y) * area.Width,
                    backBuffer.data() + static_cast<size_t>(area.Y + y) * width + area.X, area.Width * 4);
    return ResultOk;
}

CDeviceShader* RecordingBackend::CreatePixelShader(const std::string& source, std::string& errors)
{
    Record("CreatePixelShader");
    if (source.find("error") != std::string::npos) {
        errors = "0:1: syntax error";
        return nullptr;
    }
    auto* s = new Shader();
    s->source = source;
    return s;
}

void RecordingBackend::ReleasePixelShader(CDeviceShader* s)
{
    Record("ReleasePixelShader");
    delete static_cast<Shader*>(s);
}

std::unique_ptr<ox::graphics::CRenderer> MakeRecordingRenderer(RecordingBackend*& backend, int sourceWidth,
                                                               int sourceHeight, unsigned windowWidth,
                                                               unsigned windowHeight)
{
    auto owned = std::make_unique<RecordingBackend>();
    backend = owned.get();
    auto renderer = std::make_unique<ox::graphics::CRenderer>(std::move(owned));
    renderer->SetSourceResolution(sourceWidth, sourceHeight);
    renderer->InitWindow(false, true, windowWidth, windowHeight);
    return renderer;
}

} // namespace oxtest

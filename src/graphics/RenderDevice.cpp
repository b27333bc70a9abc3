#include "graphics/RenderDevice.h"

#include "diag/Log.h"
#include "misc/GamePack.h"

#include <cstring>
#include <map>
#include <thread>

namespace ox::graphics {

namespace {

IRenderBackend* g_Backend = nullptr;
RenderDevice* g_Device = nullptr;

struct PrimitiveInfo {
    unsigned vertsPerPrimitive;
    unsigned minVerts;
};
// By primitive type: point list, line list, line strip, triangle list, strip, fan.
constexpr PrimitiveInfo kPrimitives[7] = {{1, 1}, {1, 1}, {2, 2}, {1, 2}, {3, 3}, {1, 3}, {1, 3}};

// Stage states that go out as sampler states, by stage-state number.
uint32_t StageToSamplerState(unsigned state)
{
    switch (state) {
    case TssAddressU: return SampAddressU;
    case TssAddressV: return SampAddressV;
    case TssMagFilter: return SampMagFilter;
    case TssMinFilter: return SampMinFilter;
    case TssMipFilter: return SampMipFilter;
    default: return 0;
    }
}

struct BlendFactors {
    uint32_t src, dest;
};
BlendFactors BlendTable(uint32_t mode)
{
    switch (mode) {
    case BlendNone: return {BlendFactorOne, BlendFactorZero};
    case BlendAdditive: return {BlendFactorSrcAlpha, BlendFactorOne};
    case BlendNormal:
    default: return {BlendFactorSrcAlpha, BlendFactorInvSrcAlpha};
    }
}

} // namespace

IRenderBackend* GetRenderBackend() { return g_Backend; }
void SetRenderBackend(IRenderBackend* backend) { g_Backend = backend; }
RenderDevice* GetRenderDevice() { return g_Device; }
void SetRenderDevice(RenderDevice* device) { g_Device = device; }

bool FirstDrawProblem(const void* object) { return !g_Device || g_Device->FirstProblemWith(object); }

bool CheckResult(DeviceResult result, const char* what, int level)
{
    if (result >= 0)
        return false;
    OX_LOG("graphics", static_cast<diag::LogLevel>(level), "%s failed, result: %x", what,
           static_cast<unsigned>(result));
    return true;
}

bool Stage::operator==(const Stage& other) const
{
    return Texture == other.Texture && std::memcmp(States, other.States, sizeof States) == 0;
}

bool RenderDevice::IsSupportedState(unsigned state)
{
    return (state >= TssColorOp && state <= TssAlphaArg2) || state == TssTexCoordIndex || state == TssAddressU ||
           state == TssAddressV || state == TssMagFilter || state == TssMinFilter || state == TssMipFilter;
}

void RenderDevice::Init()
{
    bool device = m_Backend && m_Backend->HasDevice();
    OX_ASSERT(device);
    if (!device)
        return;
    m_StatesChanged = false;
    m_ProblemsTold.clear();
    m_WantedBlend = BlendNormal;
    m_AppliedBlend = 0;
    m_WantedShader = m_AppliedShader = nullptr;
    m_WantedTarget = m_AppliedTarget = nullptr;

    m_Backend->SetRenderState(RsAlphaBlendEnable, 1);
    m_Backend->SetRenderState(RsSrcBlend, BlendFactorSrcAlpha);
    m_Backend->SetRenderState(RsDestBlend, BlendFactorInvSrcAlpha);
    m_Backend->SetRenderState(RsLighting, 0);
    m_Backend->SetRenderState(RsSpecularEnable, 0);
    m_Backend->SetRenderState(RsZWriteEnable, 0);
    m_Backend->SetRenderState(RsZEnable, 0);
    m_Backend->SetRenderState(RsCullMode, CullNone);
    m_Backend->SetRenderState(RsClipping, 0);
    m_Backend->SetRenderState(RsDitherEnable, 0);

    for (unsigned s = 0; s < StagesCount; ++s) {
        Stage& stage = m_Wanted[s];
        stage = Stage();
        const uint32_t op = s == 0 ? TopModulate : TopDisable;
        stage.States[TssColorOp] = op;
        stage.States[TssColorArg1] = TaTexture;
        stage.States[TssColorArg2] = TaCurrent;
        stage.States[TssAlphaOp] = op;
        stage.States[TssAlphaArg1] = TaTexture;
        stage.States[TssAlphaArg2] = TaCurrent;
        stage.States[TssTexCoordIndex] = 0;
        stage.States[TssAddressU] = TAddressClamp;
        stage.States[TssAddressV] = TAddressClamp;
        stage.States[TssMagFilter] = TexfLinear;
        stage.States[TssMinFilter] = TexfLinear;
        stage.States[TssMipFilter] = TexfNone;
        m_Applied[s] = stage;
    }
    m_BatchCount = 0;
    m_BatchType = NoPrimitive;
    ApplyStates(true);
}

void RenderDevice::SendStageState(unsigned stage, unsigned state, uint32_t value)
{
    if (uint32_t sampler = StageToSamplerState(state))
        m_Backend->SetSamplerState(stage, sampler, value);
    else
        m_Backend->SetTextureStageState(stage, state, value);
}

void RenderDevice::ApplyStates(bool force)
{
    for (unsigned s = 0; s < StagesCount; ++s) {
        Stage& wanted = m_Wanted[s];
        Stage& applied = m_Applied[s];
        for (unsigned state = 0; state < Stage::StatesCount; ++state) {
            if (!IsSupportedState(state))
                continue;
            if (force || wanted.States[state] != applied.States[state]) {
                SendStageState(s, state, wanted.States[state]);
                applied.States[state] = wanted.States[state];
            }
        }
        if (force || wanted.Texture != applied.Texture) {
            m_Backend->SetTexture(s, wanted.Texture);
            applied.Texture = wanted.Texture;
        }
    }
    if (m_WantedTarget != m_AppliedTarget) {
        CheckResult(m_Backend->SetRenderTarget(m_WantedTarget), "Set render target", diag::LogError);
        m_AppliedTarget = m_WantedTarget;
    }
    if (force || m_WantedShader != m_AppliedShader) {
        m_Backend->SetPixelShader(m_WantedShader ? m_WantedShader->GetDeviceShader() : nullptr);
        m_AppliedShader = m_WantedShader;
    }
    if (force || m_WantedBlend != m_AppliedBlend) {
        const BlendFactors f = BlendTable(m_WantedBlend);
        m_Backend->SetRenderState(RsSrcBlend, f.src);
        m_Backend->SetRenderState(RsDestBlend, f.dest);
        m_AppliedBlend = m_WantedBlend;
    }
}

void RenderDevice::SetTexture(unsigned stage, CDeviceTexture* texture)
{
    if (stage >= StagesCount)
        return;
    if (m_Wanted[stage].Texture != texture) {
        m_Wanted[stage].Texture = texture;
        m_StatesChanged = true;
    }
}

void RenderDevice::SetStageState(unsigned stage, unsigned state, uint32_t value)
{
    if (stage >= StagesCount || state >= Stage::StatesCount)
        return;
    if (m_Wanted[stage].States[state] != value) {
        m_Wanted[stage].States[state] = value;
        m_StatesChanged = true;
    }
}

void RenderDevice::SetBlendMode(BlendModes mode)
{
    if (m_WantedBlend != mode) {
        m_WantedBlend = mode;
        m_StatesChanged = true;
    }
}

void RenderDevice::SetPixelShader(const CPixelShader* shader)
{
    if (m_WantedShader != shader) {
        m_WantedShader = shader;
        m_StatesChanged = true;
    }
}

void RenderDevice::SetRenderTarget(CDeviceTexture* target)
{
    if (m_WantedTarget != target) {
        m_WantedTarget = target;
        m_StatesChanged = true;
    }
}

void RenderDevice::Append(const Vertex* vertices, unsigned count)
{
    std::memcpy(m_Batch + m_BatchCount * sizeof(Vertex), vertices, count * sizeof(Vertex));
    m_BatchCount += count;
}

void RenderDevice::Draw(PrimitiveType type, const Vertex* vertices, unsigned count)
{
    constexpr unsigned stride = sizeof(Vertex);
    bool differs = false;
    if (m_StatesChanged) {
        differs = m_WantedBlend != m_AppliedBlend || m_WantedShader != m_AppliedShader ||
                  m_WantedTarget != m_AppliedTarget;
        for (unsigned s = 0; s < StagesCount && !differs; ++s)
            differs = !(m_Wanted[s] == m_Applied[s]);
    }
    if (differs || type != m_BatchType || m_BatchFormat != VertexFormatCode || m_BatchStride != stride) {
        Flush();
        ApplyStates(false);
        m_BatchType = type;
        m_BatchFormat = VertexFormatCode;
        m_BatchStride = stride;
    }
    const PrimitiveInfo info = type <= PrimitiveTriangleFan ? kPrimitives[type] : PrimitiveInfo {1, 1};
    unsigned capacity = BatchBytes / stride - m_BatchCount;
    while (count > capacity) {
        unsigned take = capacity / info.vertsPerPrimitive * info.vertsPerPrimitive;
        if (take < info.minVerts)
            take = 0;
        Append(vertices, take);
        vertices += take;
        count -= take;
        Flush();
        capacity = BatchBytes / stride - m_BatchCount;
    }
    Append(vertices, count);
    m_StatesChanged = false;
}

void RenderDevice::ForgetTexture(CDeviceTexture* texture)
{
    if (!texture)
        return;
    bool used = m_WantedTarget == texture || m_AppliedTarget == texture;
    for (unsigned s = 0; s < StagesCount; ++s)
        used = used || m_Wanted[s].Texture == texture || m_Applied[s].Texture == texture;
    if (!used)
        return;
    Flush();
    for (unsigned s = 0; s < StagesCount; ++s) {
        if (m_Wanted[s].Texture == texture)
            SetTexture(s, nullptr);
        if (m_Applied[s].Texture == texture) {
            if (m_Backend)
                m_Backend->SetTexture(s, nullptr);
            m_Applied[s].Texture = nullptr;
        }
    }
    if (m_WantedTarget == texture)
        SetRenderTarget(nullptr);
    if (m_AppliedTarget == texture) {
        if (m_Backend)
            m_Backend->SetRenderTarget(nullptr);
        m_AppliedTarget = nullptr;
    }
}

void RenderDevice::Flush()
{
    if (m_BatchCount == 0)
        return;
    unsigned primitives = m_BatchCount;
    if (m_BatchType == PrimitiveTriangleList)
        primitives = m_BatchCount / 3;
    else if (m_BatchType == PrimitiveLineList)
        primitives = m_BatchCount / 2;
    if (m_Backend)
        m_Backend->DrawPrimitiveUP(static_cast<PrimitiveType>(m_BatchType), primitives,
                                   reinterpret_cast<const Vertex*>(m_Batch), m_BatchCount);
    m_Primitives += primitives;
    ++m_DrawCalls;
    m_BatchCount = 0;
}

bool RenderDevice::BeginScene()
{
    if (!m_Backend || CheckResult(m_Backend->BeginScene(), "Begin scene", diag::LogError))
        return false;
    m_Backend->Clear(0xFF000000u);
    for (Stage& stage : m_Wanted)
        stage.Texture = nullptr;
    ApplyStates(true);
    m_StatesChanged = false;
    m_BatchCount = 0;
    m_BatchType = NoPrimitive;
    m_DrawCalls = 0;
    m_Primitives = 0;
    return true;
}

bool RenderDevice::EndScene()
{
    if (!m_Backend)
        return true;
    Flush();
    for (unsigned s = 0; s < StagesCount; ++s)
        SetTexture(s, nullptr);
    m_Backend->EndScene();
    bool query = false;
    if (m_UseQuery) {
        query = m_Backend->CreateEventQuery();
        if (!query) {
            CheckResult(ResultNotAvailable, "Create query", diag::LogWarning);
            m_UseQuery = false;
        }
    }
    const bool presentFailed = CheckResult(m_Backend->Present(), "Present", diag::LogError);
    if (query) {
        // Only a failed present waits for the device to finish the frame.
        if (presentFailed)
            while (!m_Backend->PollEventQuery())
                std::this_thread::yield();
        m_Backend->ReleaseEventQuery();
    }
    m_Snapshot = false;
    return true;
}

void RenderDevice::Clear(const Color& color)
{
    if (!m_Backend)
        return;
    Flush();
    if (m_StatesChanged) {
        ApplyStates(false);
        m_StatesChanged = false;
    }
    m_Backend->Clear(color.GetARGB());
}

void RenderDevice::EnumResolutions(ResolutionsT& out)
{
    out.clear();
    if (m_Backend)
        m_Backend->EnumModes(out);
}

// Pixel shaders ------------------------------------------------------------------------

namespace {

// Every shader and its device object: the source stays with the shader.
std::map<const CPixelShader*, CDeviceShader*>& ShaderTable()
{
    static auto* table = new std::map<const CPixelShader*, CDeviceShader*>();
    return *table;
}

CDeviceShader* Compile(const std::string& source, std::string& errors)
{
    IRenderBackend* backend = GetRenderBackend();
    if (!backend || !backend->HasDevice()) {
        errors = "no device";
        return nullptr;
    }
    return backend->CreatePixelShader(source, errors);
}

void ReleaseDeviceShader(CDeviceShader*& shader)
{
    if (shader && GetRenderBackend())
        GetRenderBackend()->ReleasePixelShader(shader);
    shader = nullptr;
}

} // namespace

CPixelShader::CPixelShader() { ShaderTable()[this] = nullptr; }

CPixelShader::~CPixelShader()
{
    auto it = ShaderTable().find(this);
    if (it != ShaderTable().end()) {
        ReleaseDeviceShader(it->second);
        ShaderTable().erase(it);
    }
}

CDeviceShader* CPixelShader::GetDeviceShader() const
{
    auto it = ShaderTable().find(this);
    return it == ShaderTable().end() ? nullptr : it->second;
}

bool CPixelShader::Load(const char* file, const char* entry, const char* /*profile*/)
{
    misc::CGamePack& pack = misc::g_GamePack::Instance();
    unsigned size = 0;
    const void* data = pack.Open(file, &size);
    if (!data) {
        OX_LOG("graphics", diag::LogError, "LoadShader failed: %s", (std::string("cannot read ") + file).c_str());
        return false;
    }
    std::string source(static_cast<const char*>(data), size);
    pack.Close(data);
    return LoadSource(source, entry);
}

bool CPixelShader::LoadSource(const std::string& source, const char* entry)
{
    m_Source = source;
    if (entry && *entry && std::strcmp(entry, "main") != 0)
        m_Source += std::string("\nvoid main() { ") + entry + "(); }\n";
    CDeviceShader*& shader = ShaderTable()[this];
    ReleaseDeviceShader(shader);
    std::string errors;
    shader = Compile(m_Source, errors);
    if (!shader) {
        if (!errors.empty())
            OX_LOG("graphics", diag::LogError, "LoadShader failed: %s", errors.c_str());
        else
            OX_LOG("graphics", diag::LogError, "CreatePixelShader failed");
        return false;
    }
    return true;
}

void CPixelShader::ReleaseShaders()
{
    for (auto& [owner, shader] : ShaderTable())
        ReleaseDeviceShader(shader);
}

void CPixelShader::RestoreShaders()
{
    for (auto& [owner, shader] : ShaderTable()) {
        if (shader || owner->m_Source.empty())
            continue;
        std::string errors;
        shader = Compile(owner->m_Source, errors);
        if (!shader)
            OX_LOG("graphics", diag::LogError, "LoadShader failed: %s", errors.c_str());
    }
}

} // namespace ox::graphics

#pragma once
// The render device: a shadow of the device's state (what is wanted and what was last
// applied) and one vertex batch of 192,000 bytes, so that a run of primitives with equal
// state reaches the backend as one draw call. Setters only note what is wanted; a draw
// that finds the wanted state different flushes the batch and applies it.
#include "graphics/Color.h"
#include "graphics/RenderBackend.h"
#include "graphics/RendererState.h"

#include <set>

namespace ox::graphics {

class CPixelShader;

// The backend of the one render device, for the objects that own device resources
// (surfaces, shaders). Null while no renderer exists.
IRenderBackend* GetRenderBackend();
void SetRenderBackend(IRenderBackend* backend);
class RenderDevice;
// The render device of the one renderer; null while none exists.
RenderDevice* GetRenderDevice();
void SetRenderDevice(RenderDevice* device);
// Whether a problem with `object` that would recur at every draw (a surface that gets no
// device texture, a font whose glyphs have none) should be logged now: true the first time
// for each object while the render device lives, and always without one.
bool FirstDrawProblem(const void* object);

struct Stage {
    static constexpr unsigned StatesCount = 25;
    CDeviceTexture* Texture = nullptr;
    uint32_t States[StatesCount] = {};

    bool operator==(const Stage& other) const;
};

class RenderDevice {
public:
    static constexpr unsigned BatchBytes = 192000;
    static constexpr unsigned StagesCount = 2;
    static constexpr uint32_t NoPrimitive = 0x7FFFFFFF;

    explicit RenderDevice(IRenderBackend* backend = nullptr) : m_Backend(backend) {}
    RenderDevice(const RenderDevice&) = delete;
    RenderDevice& operator=(const RenderDevice&) = delete;

    void SetBackend(IRenderBackend* backend) { m_Backend = backend; }
    IRenderBackend* GetBackend() const { return m_Backend; }

    // After each device creation or reset: the fixed render states, the stage defaults,
    // everything forced to the device.
    void Init();
    bool BeginScene();
    bool EndScene();
    // Clears the whole current target (the batch is drawn first, so order is kept).
    void Clear(const Color& color);
    void Flush();

    void SetTexture(unsigned stage, CDeviceTexture* texture);
    void SetStageState(unsigned stage, unsigned state, uint32_t value);
    void SetBlendMode(BlendModes mode);
    void SetPixelShader(const CPixelShader* shader);
    // A render-target texture, or null for the back buffer.
    void SetRenderTarget(CDeviceTexture* target);
    void Draw(PrimitiveType type, const Vertex* vertices, unsigned count);
    // A texture is about to go: what is batched with it is drawn, and no state refers to it
    // any longer (a new texture may get its address).
    void ForgetTexture(CDeviceTexture* texture);

    void StartSnapshot() { m_Snapshot = true; }
    bool IsSnapshot() const { return m_Snapshot; }
    void EnumResolutions(ResolutionsT& out);

    static bool IsSupportedState(unsigned state);

    // True the first time `object` is named since the device was made or reset.
    bool FirstProblemWith(const void* object) { return m_ProblemsTold.insert(object).second; }

    // Statistics of the current frame, and the batch.
    unsigned GetDrawCalls() const { return m_DrawCalls; }
    unsigned GetPrimitives() const { return m_Primitives; }
    unsigned GetBatchCount() const { return m_BatchCount; }
    bool IsUsingQuery() const { return m_UseQuery; }
    const Stage& GetWantedStage(unsigned stage) const { return m_Wanted[stage]; }
    CDeviceTexture* GetRenderTarget() const { return m_WantedTarget; }

private:
    void ApplyStates(bool force);
    void SendStageState(unsigned stage, unsigned state, uint32_t value);
    void Append(const Vertex* vertices, unsigned count);

    IRenderBackend* m_Backend;
    bool m_UseQuery = true;
    bool m_StatesChanged = false;
    bool m_Snapshot = false;
    Stage m_Wanted[StagesCount];
    Stage m_Applied[StagesCount];
    uint32_t m_WantedBlend = BlendNormal;
    uint32_t m_AppliedBlend = 0;
    const CPixelShader* m_WantedShader = nullptr;
    const CPixelShader* m_AppliedShader = nullptr;
    CDeviceTexture* m_WantedTarget = nullptr;
    CDeviceTexture* m_AppliedTarget = nullptr;
    unsigned m_DrawCalls = 0;
    unsigned m_Primitives = 0;
    std::set<const void*> m_ProblemsTold;

    uint32_t m_BatchType = NoPrimitive;
    uint32_t m_BatchFormat = 0;
    unsigned m_BatchStride = 0;
    unsigned m_BatchCount = 0;
    alignas(16) unsigned char m_Batch[BatchBytes];
};

// A pixel shader from a GLSL fragment source. Its device object is kept in a global table
// so that a device reset can make it again from the kept source.
class CPixelShader {
public:
    CPixelShader();
    virtual ~CPixelShader();
    CPixelShader(const CPixelShader&) = delete;
    CPixelShader& operator=(const CPixelShader&) = delete;

    // Reads the source through the game pack and compiles it. `entry` names the function
    // that stands for main (a source with its own main gives "main"); `profile` is kept
    // for the record only.
    bool Load(const char* file, const char* entry, const char* profile);
    // Compiles a source held in memory.
    bool LoadSource(const std::string& source, const char* entry = "main");
    // Constant defaults live in the source here: nothing to do.
    void ApplyDefaults() {}
    CDeviceShader* GetDeviceShader() const;
    const std::string& GetSource() const { return m_Source; }

    // Before a device goes away, and after a new one exists.
    static void ReleaseShaders();
    static void RestoreShaders();

private:
    std::string m_Source;
};

} // namespace ox::graphics

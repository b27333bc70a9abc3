#include "graphics/gl/GlBackend.h"

#include "diag/Log.h"
#include "graphics/Renderer.h"

#include <SDL.h>

#include <GL/glcorearb.h>

#include <algorithm>
#include <cstring>
#include <vector>

namespace ox::graphics {

// The GL entry points, loaded from the context.
#define OX_GL_FUNCTIONS(X)                                                                     \
    X(PFNGLGETERRORPROC, GetError)                                                             \
    X(PFNGLGETSTRINGPROC, GetString)                                                           \
    X(PFNGLGETINTEGERVPROC, GetIntegerv)                                                       \
    X(PFNGLVIEWPORTPROC, Viewport)                                                             \
    X(PFNGLCLEARCOLORPROC, ClearColor)                                                         \
    X(PFNGLCLEARPROC, Clear)                                                                   \
    X(PFNGLENABLEPROC, Enable)                                                                 \
    X(PFNGLDISABLEPROC, Disable)                                                               \
    X(PFNGLBLENDFUNCPROC, BlendFunc)                                                           \
    X(PFNGLGENTEXTURESPROC, GenTextures)                                                       \
    X(PFNGLDELETETEXTURESPROC, DeleteTextures)                                                 \
    X(PFNGLBINDTEXTUREPROC, BindTexture)                                                       \
    X(PFNGLTEXIMAGE2DPROC, TexImage2D)                                                         \
    X(PFNGLTEXSUBIMAGE2DPROC, TexSubImage2D)                                                   \
    X(PFNGLCOMPRESSEDTEXIMAGE2DPROC, CompressedTexImage2D)                                     \
    X(PFNGLCOMPRESSEDTEXSUBIMAGE2DPROC, CompressedTexSubImage2D)                               \
    X(PFNGLTEXPARAMETERIPROC, TexParameteri)                                                   \
    X(PFNGLPIXELSTOREIPROC, PixelStorei)                                                       \
    X(PFNGLGETTEXIMAGEPROC, GetTexImage)                                                       \
    X(PFNGLREADPIXELSPROC, ReadPixels)                                                         \
    X(PFNGLREADBUFFERPROC, ReadBuffer)                                                         \
    X(PFNGLACTIVETEXTUREPROC, ActiveTexture)                                                   \
    X(PFNGLGENFRAMEBUFFERSPROC, GenFramebuffers)                                               \
    X(PFNGLDELETEFRAMEBUFFERSPROC, DeleteFramebuffers)                                         \
    X(PFNGLBINDFRAMEBUFFERPROC, BindFramebuffer)                                               \
    X(PFNGLFRAMEBUFFERTEXTURE2DPROC, FramebufferTexture2D)                                     \
    X(PFNGLCHECKFRAMEBUFFERSTATUSPROC, CheckFramebufferStatus)                                 \
    X(PFNGLGENVERTEXARRAYSPROC, GenVertexArrays)                                               \
    X(PFNGLDELETEVERTEXARRAYSPROC, DeleteVertexArrays)                                         \
    X(PFNGLBINDVERTEXARRAYPROC, BindVertexArray)                                               \
    X(PFNGLGENBUFFERSPROC, GenBuffers)                                                         \
    X(PFNGLDELETEBUFFERSPROC, DeleteBuffers)                                                   \
    X(PFNGLBINDBUFFERPROC, BindBuffer)                                                         \
    X(PFNGLBUFFERDATAPROC, BufferData)                                                         \
    X(PFNGLVERTEXATTRIBPOINTERPROC, VertexAttribPointer)                                       \
    X(PFNGLENABLEVERTEXATTRIBARRAYPROC, EnableVertexAttribArray)                               \
    X(PFNGLDRAWARRAYSPROC, DrawArrays)                                                         \
    X(PFNGLCREATESHADERPROC, CreateShader)                                                     \
    X(PFNGLSHADERSOURCEPROC, ShaderSource)                                                     \
    X(PFNGLCOMPILESHADERPROC, CompileShader)                                                   \
    X(PFNGLGETSHADERIVPROC, GetShaderiv)                                                       \
    X(PFNGLGETSHADERINFOLOGPROC, GetShaderInfoLog)                                             \
    X(PFNGLDELETESHADERPROC, DeleteShader)                                                     \
    X(PFNGLCREATEPROGRAMPROC, CreateProgram)                                                   \
    X(PFNGLATTACHSHADERPROC, AttachShader)                                                     \
    X(PFNGLLINKPROGRAMPROC, LinkProgram)                                                       \
    X(PFNGLGETPROGRAMIVPROC, GetProgramiv)                                                     \
    X(PFNGLGETPROGRAMINFOLOGPROC, GetProgramInfoLog)                                           \
    X(PFNGLDELETEPROGRAMPROC, DeleteProgram)                                                   \
    X(PFNGLUSEPROGRAMPROC, UseProgram)                                                         \
    X(PFNGLGETUNIFORMLOCATIONPROC, GetUniformLocation)                                         \
    X(PFNGLUNIFORM1IPROC, Uniform1i)                                                           \
    X(PFNGLUNIFORM2FPROC, Uniform2f)                                                           \
    X(PFNGLUNIFORM3IPROC, Uniform3i)                                                           \
    X(PFNGLGENSAMPLERSPROC, GenSamplers)                                                       \
    X(PFNGLDELETESAMPLERSPROC, DeleteSamplers)                                                 \
    X(PFNGLBINDSAMPLERPROC, BindSampler)                                                       \
    X(PFNGLSAMPLERPARAMETERIPROC, SamplerParameteri)                                           \
    X(PFNGLFENCESYNCPROC, FenceSync)                                                           \
    X(PFNGLCLIENTWAITSYNCPROC, ClientWaitSync)                                                 \
    X(PFNGLDELETESYNCPROC, DeleteSync)

struct GlFunctions {
#define OX_GL_MEMBER(type, name) type name = nullptr;
    OX_GL_FUNCTIONS(OX_GL_MEMBER)
#undef OX_GL_MEMBER

    // False with the name of the first entry point that is missing.
    bool Load(const char*& missing)
    {
#define OX_GL_LOAD(type, name)                                                                 \
    name = reinterpret_cast<type>(SDL_GL_GetProcAddress("gl" #name));                          \
    if (!name) {                                                                               \
        missing = "gl" #name;                                                                  \
        return false;                                                                          \
    }
        OX_GL_FUNCTIONS(OX_GL_LOAD)
#undef OX_GL_LOAD
        return true;
    }
};

struct CGlBackend::Texture : CDeviceTexture {
    GLuint id = 0;
    GLuint fbo = 0;
};

struct CGlBackend::Program : CDeviceShader {
    GLuint id = 0;
    GLint scale = -1, offset = -1, texture = -1, colorOp = -1, alphaOp = -1;
};

namespace {

const char* kVertexShader = R"(#version 330 core
layout(location = 0) in vec2 a_Position;
layout(location = 1) in vec4 a_Color;
layout(location = 2) in vec2 a_TexCoord;
uniform vec2 u_Scale;
uniform vec2 u_Offset;
out vec4 v_Color;
out vec2 v_TexCoord;
void main()
{
    // Pixel centres lie on whole numbers in the vertices, on halves in GL.
    gl_Position = vec4((a_Position + 0.5) * u_Scale + u_Offset, 0.0, 1.0);
    v_Color = a_Color;
    v_TexCoord = a_TexCoord;
}
)";

// Stage 0 of the fixed-function texture stages: operation, first and second argument for
// colour and alpha (disable 1, select first 2, select second 3, modulate 4; argument
// texture 2, else the diffuse colour).
const char* kFragmentShader = R"(#version 330 core
in vec4 v_Color;
in vec2 v_TexCoord;
uniform sampler2D u_Texture;
uniform ivec3 u_ColorOp;
uniform ivec3 u_AlphaOp;
out vec4 o_Color;
vec4 Arg(int a, vec4 t) { return a == 2 ? t : v_Color; }
vec4 Op(ivec3 op, vec4 t)
{
    if (op.x == 1) return v_Color;
    if (op.x == 2) return Arg(op.y, t);
    if (op.x == 3) return Arg(op.z, t);
    return Arg(op.y, t) * Arg(op.z, t);
}
void main()
{
    vec4 t = texture(u_Texture, v_TexCoord);
    o_Color = vec4(Op(u_ColorOp, t).rgb, Op(u_AlphaOp, t).a);
}
)";

struct FormatInfo {
    GLenum internal, format, type;
    bool compressed;
};

bool GetFormat(uint8_t format, FormatInfo& info)
{
    switch (format) {
    case FormatA8R8G8B8: info = {GL_RGBA8, GL_BGRA, GL_UNSIGNED_INT_8_8_8_8_REV, false}; return true;
    case FormatA4R4G4B4: info = {GL_RGBA4, GL_BGRA, GL_UNSIGNED_SHORT_4_4_4_4_REV, false}; return true;
    case FormatR5G6B5: info = {GL_RGB, GL_RGB, GL_UNSIGNED_SHORT_5_6_5, false}; return true;
    case FormatA1R5G5B5: info = {GL_RGB5_A1, GL_BGRA, GL_UNSIGNED_SHORT_1_5_5_5_REV, false}; return true;
    case FormatDXT1: info = {0x83F1 /* COMPRESSED_RGBA_S3TC_DXT1 */, 0, 0, true}; return true;
    case FormatDXT3: info = {0x83F2 /* COMPRESSED_RGBA_S3TC_DXT3 */, 0, 0, true}; return true;
    case FormatDXT5: info = {0x83F3 /* COMPRESSED_RGBA_S3TC_DXT5 */, 0, 0, true}; return true;
    default: return false;
    }
}

size_t LevelSize(uint8_t format, unsigned w, unsigned h)
{
    if (format == FormatDXT1 || format == FormatDXT3 || format == FormatDXT5)
        return static_cast<size_t>((w + 3) / 4) * ((h + 3) / 4) * (format == FormatDXT1 ? 8 : 16);
    return static_cast<size_t>(FormatBitsPerPixel(format)) * w * h / 8;
}

GLenum BlendFactorToGl(uint32_t factor)
{
    switch (factor) {
    case 1: return GL_ZERO;
    case 2: return GL_ONE;
    case 3: return GL_SRC_COLOR;
    case 4: return GL_ONE_MINUS_SRC_COLOR;
    case 5: return GL_SRC_ALPHA;
    case 6: return GL_ONE_MINUS_SRC_ALPHA;
    case 7: return GL_DST_ALPHA;
    case 8: return GL_ONE_MINUS_DST_ALPHA;
    case 9: return GL_DST_COLOR;
    case 10: return GL_ONE_MINUS_DST_COLOR;
    default: return GL_ONE;
    }
}

GLenum PrimitiveToGl(PrimitiveType type, unsigned primitives, unsigned vertices, GLsizei& count)
{
    GLenum mode = GL_TRIANGLES;
    unsigned wanted = primitives;
    switch (type) {
    case PrimitivePointList: mode = GL_POINTS; wanted = primitives; break;
    case PrimitiveLineList: mode = GL_LINES; wanted = primitives * 2; break;
    case PrimitiveLineStrip: mode = GL_LINE_STRIP; wanted = primitives + 1; break;
    case PrimitiveTriangleList: mode = GL_TRIANGLES; wanted = primitives * 3; break;
    case PrimitiveTriangleStrip: mode = GL_TRIANGLE_STRIP; wanted = primitives + 2; break;
    case PrimitiveTriangleFan: mode = GL_TRIANGLE_FAN; wanted = primitives + 2; break;
    }
    count = static_cast<GLsizei>(std::min(wanted, vertices));
    return mode;
}

} // namespace

std::unique_ptr<IRenderBackend> CreateDefaultBackend() { return std::make_unique<CGlBackend>(); }

CGlBackend::CGlBackend() : m_Gl(std::make_unique<GlFunctions>()) {}

CGlBackend::~CGlBackend()
{
    ReleaseDevice(false);
    for (Texture* texture : m_Textures)
        delete texture;
    for (Program* program : m_Programs)
        delete program;
}

bool CGlBackend::Check(const char* what)
{
    GLenum error = m_Gl->GetError();
    if (error == GL_NO_ERROR)
        return true;
    while (m_Gl->GetError() != GL_NO_ERROR) {
    }
    OX_LOG("graphics", diag::LogError, "%s: GL error 0x%x", what, error);
    return false;
}

DeviceResult CGlBackend::CreateDevice(void* window, unsigned width, unsigned height, bool fullscreen)
{
    if (m_Context)
        return ResetDevice(width, height, fullscreen);
    auto* wnd = static_cast<SDL_Window*>(window);
    if (!wnd)
        return ResultInvalidCall;
    if (!(SDL_GetWindowFlags(wnd) & SDL_WINDOW_OPENGL)) {
        OX_LOG("graphics", diag::LogError, "the window has no OpenGL support");
        return ResultNotAvailable;
    }
    SDL_GL_SetAttribute(SDL_GL_CONTEXT_MAJOR_VERSION, 3);
    SDL_GL_SetAttribute(SDL_GL_CONTEXT_MINOR_VERSION, 3);
    SDL_GL_SetAttribute(SDL_GL_CONTEXT_PROFILE_MASK, SDL_GL_CONTEXT_PROFILE_CORE);
    SDL_GL_SetAttribute(SDL_GL_DOUBLEBUFFER, 1);
    SDL_GLContext context = SDL_GL_CreateContext(wnd);
    if (!context) {
        OX_LOG("graphics", diag::LogError, "SDL_GL_CreateContext failed: %s", SDL_GetError());
        return ResultNotAvailable;
    }
    m_Window = wnd;
    m_Context = context;
    SDL_GL_MakeCurrent(wnd, context);
    SDL_GL_SetSwapInterval(0);
    const char* missing = "";
    if (!m_Gl->Load(missing)) {
        OX_LOG("graphics", diag::LogError, "OpenGL entry point %s is missing", missing);
        SDL_GL_DeleteContext(context);
        m_Context = nullptr;
        return ResultNotAvailable;
    }
    m_Width = width;
    m_Height = height;
    if (!Setup()) {
        Teardown();
        return ResultNotAvailable;
    }
    return ResultOk;
}

bool CGlBackend::Setup()
{
    auto& gl = *m_Gl;
    const char* renderer = reinterpret_cast<const char*>(gl.GetString(GL_RENDERER));
    const char* version = reinterpret_cast<const char*>(gl.GetString(GL_VERSION));
    m_RendererName = std::string(renderer ? renderer : "?") + ", " + (version ? version : "?");
    OX_LOG("graphics", diag::LogInfo, "OpenGL device: %s", m_RendererName.c_str());

    std::string errors;
    GLuint program = CompileProgram(kFragmentShader, errors);
    if (!program) {
        OX_LOG("graphics", diag::LogError, "the default shaders do not build: %s", errors.c_str());
        return false;
    }
    m_DefaultProgram = new Program();
    m_DefaultProgram->id = program;
    m_DefaultProgram->scale = gl.GetUniformLocation(program, "u_Scale");
    m_DefaultProgram->offset = gl.GetUniformLocation(program, "u_Offset");
    m_DefaultProgram->texture = gl.GetUniformLocation(program, "u_Texture");
    m_DefaultProgram->colorOp = gl.GetUniformLocation(program, "u_ColorOp");
    m_DefaultProgram->alphaOp = gl.GetUniformLocation(program, "u_AlphaOp");
    m_Program = m_DefaultProgram;
    gl.UseProgram(program);

    gl.GenVertexArrays(1, &m_Vao);
    gl.BindVertexArray(m_Vao);
    gl.GenBuffers(1, &m_Vbo);
    gl.BindBuffer(GL_ARRAY_BUFFER, m_Vbo);
    gl.BufferData(GL_ARRAY_BUFFER, 6000 * sizeof(Vertex), nullptr, GL_STREAM_DRAW);
    gl.EnableVertexAttribArray(0);
    gl.VertexAttribPointer(0, 2, GL_FLOAT, GL_FALSE, sizeof(Vertex), reinterpret_cast<void*>(0));
    gl.EnableVertexAttribArray(1);
    // The A8R8G8B8 word is B, G, R, A in memory.
    gl.VertexAttribPointer(1, GL_BGRA, GL_UNSIGNED_BYTE, GL_TRUE, sizeof(Vertex), reinterpret_cast<void*>(16));
    gl.EnableVertexAttribArray(2);
    gl.VertexAttribPointer(2, 2, GL_FLOAT, GL_FALSE, sizeof(Vertex), reinterpret_cast<void*>(24));

    // An untextured draw samples white.
    const uint32_t white = 0xFFFFFFFFu;
    gl.GenTextures(1, &m_White);
    gl.ActiveTexture(GL_TEXTURE0);
    gl.BindTexture(GL_TEXTURE_2D, m_White);
    gl.TexParameteri(GL_TEXTURE_2D, GL_TEXTURE_MAX_LEVEL, 0);
    gl.TexImage2D(GL_TEXTURE_2D, 0, GL_RGBA8, 1, 1, 0, GL_BGRA, GL_UNSIGNED_INT_8_8_8_8_REV, &white);
    m_Bound = nullptr;

    gl.GenSamplers(1, &m_Sampler);
    gl.BindSampler(0, m_Sampler);
    gl.SamplerParameteri(m_Sampler, GL_TEXTURE_WRAP_S, GL_CLAMP_TO_EDGE);
    gl.SamplerParameteri(m_Sampler, GL_TEXTURE_WRAP_T, GL_CLAMP_TO_EDGE);
    gl.SamplerParameteri(m_Sampler, GL_TEXTURE_MAG_FILTER, GL_LINEAR);
    gl.SamplerParameteri(m_Sampler, GL_TEXTURE_MIN_FILTER, GL_LINEAR);

    gl.Disable(GL_DEPTH_TEST);
    gl.Disable(GL_CULL_FACE);
    gl.Disable(GL_DITHER);
    gl.Enable(GL_BLEND);
    gl.BlendFunc(GL_SRC_ALPHA, GL_ONE_MINUS_SRC_ALPHA);
    gl.PixelStorei(GL_UNPACK_ALIGNMENT, 1);
    gl.PixelStorei(GL_PACK_ALIGNMENT, 1);

    m_Stage[TssColorOp] = TopModulate;
    m_Stage[TssColorArg1] = TaTexture;
    m_Stage[TssColorArg2] = TaCurrent;
    m_Stage[TssAlphaOp] = TopModulate;
    m_Stage[TssAlphaArg1] = TaTexture;
    m_Stage[TssAlphaArg2] = TaCurrent;
    m_Target = nullptr;
    BindTarget();
    return Check("device setup");
}

void CGlBackend::Teardown()
{
    if (!m_Context)
        return;
    auto& gl = *m_Gl;
    ReleaseEventQuery();
    if (!m_Textures.empty())
        OX_LOG("graphics", diag::LogWarning, "%zu textures still exist as the device goes", m_Textures.size());
    for (Texture* texture : m_Textures) {
        if (texture->fbo)
            gl.DeleteFramebuffers(1, &texture->fbo);
        if (texture->id)
            gl.DeleteTextures(1, &texture->id);
        texture->id = texture->fbo = 0;
    }
    for (Program* program : m_Programs) {
        if (program->id)
            gl.DeleteProgram(program->id);
        program->id = 0;
    }
    if (m_DefaultProgram) {
        gl.DeleteProgram(m_DefaultProgram->id);
        delete m_DefaultProgram;
        m_DefaultProgram = nullptr;
    }
    m_Program = nullptr;
    if (m_Vbo)
        gl.DeleteBuffers(1, &m_Vbo);
    if (m_Vao)
        gl.DeleteVertexArrays(1, &m_Vao);
    if (m_Sampler)
        gl.DeleteSamplers(1, &m_Sampler);
    if (m_White)
        gl.DeleteTextures(1, &m_White);
    m_Vbo = m_Vao = m_Sampler = m_White = 0;
    m_Target = m_Bound = nullptr;
    SDL_GL_DeleteContext(static_cast<SDL_GLContext>(m_Context));
    m_Context = nullptr;
    m_Window = nullptr;
}

DeviceResult CGlBackend::ResetDevice(unsigned width, unsigned height, bool /*fullscreen*/)
{
    if (!m_Context)
        return ResultInvalidCall;
    // A GL context survives a change of window size or mode: only the viewport follows.
    m_Width = width;
    m_Height = height;
    SDL_GL_MakeCurrent(m_Window, static_cast<SDL_GLContext>(m_Context));
    BindTarget();
    return ResultOk;
}

void CGlBackend::ReleaseDevice(bool forReset)
{
    if (!forReset)
        Teardown();
}

void CGlBackend::EnumModes(ResolutionsT& out)
{
    if (!SDL_WasInit(SDL_INIT_VIDEO))
        return;
    const int count = SDL_GetNumDisplayModes(0);
    for (int i = 0; i < count; ++i) {
        SDL_DisplayMode mode;
        if (SDL_GetDisplayMode(0, i, &mode) == 0)
            out.push_back({static_cast<unsigned>(mode.w), static_cast<unsigned>(mode.h), true});
    }
}

void CGlBackend::BindTarget()
{
    auto& gl = *m_Gl;
    if (m_Target) {
        gl.BindFramebuffer(GL_FRAMEBUFFER, m_Target->fbo);
        gl.Viewport(0, 0, static_cast<GLsizei>(m_Target->Width), static_cast<GLsizei>(m_Target->Height));
    } else {
        gl.BindFramebuffer(GL_FRAMEBUFFER, 0);
        int w = 0, h = 0;
        SDL_GL_GetDrawableSize(m_Window, &w, &h);
        gl.Viewport(0, 0, w, h);
    }
    m_UniformsDirty = true;
}

DeviceResult CGlBackend::BeginScene()
{
    if (!m_Context)
        return ResultInvalidCall;
    SDL_GL_MakeCurrent(m_Window, static_cast<SDL_GLContext>(m_Context));
    return ResultOk;
}

DeviceResult CGlBackend::EndScene() { return m_Context ? ResultOk : ResultInvalidCall; }

DeviceResult CGlBackend::Present()
{
    if (!m_Context)
        return ResultInvalidCall;
    SDL_GL_SwapWindow(m_Window);
    return Check("Present") ? ResultOk : ResultFail;
}

void CGlBackend::Clear(uint32_t argb)
{
    if (!m_Context)
        return;
    auto& gl = *m_Gl;
    gl.ClearColor(((argb >> 16) & 0xFF) / 255.0f, ((argb >> 8) & 0xFF) / 255.0f, (argb & 0xFF) / 255.0f,
                  (argb >> 24) / 255.0f);
    gl.Clear(GL_COLOR_BUFFER_BIT);
}

bool CGlBackend::CreateEventQuery()
{
    if (!m_Context)
        return false;
    ReleaseEventQuery();
    m_Fence = m_Gl->FenceSync(GL_SYNC_GPU_COMMANDS_COMPLETE, 0);
    return m_Fence != nullptr;
}

bool CGlBackend::PollEventQuery()
{
    if (!m_Fence)
        return true;
    GLenum state = m_Gl->ClientWaitSync(static_cast<GLsync>(m_Fence), GL_SYNC_FLUSH_COMMANDS_BIT, 0);
    return state != GL_TIMEOUT_EXPIRED;
}

void CGlBackend::ReleaseEventQuery()
{
    if (m_Fence && m_Context)
        m_Gl->DeleteSync(static_cast<GLsync>(m_Fence));
    m_Fence = nullptr;
}

void CGlBackend::SetRenderState(uint32_t state, uint32_t value)
{
    if (!m_Context)
        return;
    auto& gl = *m_Gl;
    switch (state) {
    case RsAlphaBlendEnable: value ? gl.Enable(GL_BLEND) : gl.Disable(GL_BLEND); break;
    case RsSrcBlend:
        m_SrcBlend = value;
        gl.BlendFunc(BlendFactorToGl(m_SrcBlend), BlendFactorToGl(m_DestBlend));
        break;
    case RsDestBlend:
        m_DestBlend = value;
        gl.BlendFunc(BlendFactorToGl(m_SrcBlend), BlendFactorToGl(m_DestBlend));
        break;
    case RsDitherEnable: value ? gl.Enable(GL_DITHER) : gl.Disable(GL_DITHER); break;
    case RsZEnable: value ? gl.Enable(GL_DEPTH_TEST) : gl.Disable(GL_DEPTH_TEST); break;
    case RsCullMode: value == CullNone ? gl.Disable(GL_CULL_FACE) : gl.Enable(GL_CULL_FACE); break;
    default: break; // lighting, specular, clipping, depth writes: nothing of them exists here
    }
}

void CGlBackend::SetTextureStageState(unsigned stage, uint32_t state, uint32_t value)
{
    // Only the first stage takes part; the second stays disabled in this system.
    if (stage != 0 || state > TssAlphaArg2)
        return;
    if (m_Stage[state] != value) {
        m_Stage[state] = value;
        m_UniformsDirty = true;
    }
}

void CGlBackend::SetSamplerState(unsigned stage, uint32_t state, uint32_t value)
{
    if (stage != 0 || !m_Context)
        return;
    auto& gl = *m_Gl;
    auto address = [](uint32_t v) -> GLint {
        switch (v) {
        case TAddressWrap: return GL_REPEAT;
        case TAddressMirror: return GL_MIRRORED_REPEAT;
        case TAddressBorder: return GL_CLAMP_TO_BORDER;
        default: return GL_CLAMP_TO_EDGE;
        }
    };
    auto filter = [](uint32_t v) -> GLint { return v == TexfPoint || v == TexfNone ? GL_NEAREST : GL_LINEAR; };
    switch (state) {
    case SampAddressU: gl.SamplerParameteri(m_Sampler, GL_TEXTURE_WRAP_S, address(value)); break;
    case SampAddressV: gl.SamplerParameteri(m_Sampler, GL_TEXTURE_WRAP_T, address(value)); break;
    case SampMagFilter: gl.SamplerParameteri(m_Sampler, GL_TEXTURE_MAG_FILTER, filter(value)); break;
    case SampMinFilter: gl.SamplerParameteri(m_Sampler, GL_TEXTURE_MIN_FILTER, filter(value)); break;
    default: break; // no mip levels exist
    }
}

void CGlBackend::BindStageTexture()
{
    auto& gl = *m_Gl;
    gl.ActiveTexture(GL_TEXTURE0);
    gl.BindTexture(GL_TEXTURE_2D, m_Bound && m_Bound->id ? m_Bound->id : m_White);
}

void CGlBackend::SetTexture(unsigned stage, CDeviceTexture* texture)
{
    if (stage != 0 || !m_Context)
        return;
    m_Bound = static_cast<Texture*>(texture);
    BindStageTexture();
}

DeviceResult CGlBackend::SetRenderTarget(CDeviceTexture* target)
{
    if (!m_Context)
        return ResultInvalidCall;
    auto* texture = static_cast<Texture*>(target);
    if (texture && !texture->fbo)
        return ResultInvalidCall;
    m_Target = texture;
    BindTarget();
    return ResultOk;
}

void CGlBackend::SetPixelShader(CDeviceShader* shader)
{
    if (!m_Context)
        return;
    auto* program = static_cast<Program*>(shader);
    m_Program = program && program->id ? program : m_DefaultProgram;
    m_Gl->UseProgram(m_Program->id);
    m_UniformsDirty = true;
}

void CGlBackend::PrepareDraw()
{
    if (!m_UniformsDirty)
        return;
    auto& gl = *m_Gl;
    // Window pixels to clip space; the back buffer's rows run bottom-up in GL, a target's
    // rows top-down so that its first row is the texture's first row.
    const float w = static_cast<float>(m_Target ? m_Target->Width : std::max(m_Width, 1u));
    const float h = static_cast<float>(m_Target ? m_Target->Height : std::max(m_Height, 1u));
    if (m_Target) {
        gl.Uniform2f(m_Program->scale, 2.0f / w, 2.0f / h);
        gl.Uniform2f(m_Program->offset, -1.0f, -1.0f);
    } else {
        gl.Uniform2f(m_Program->scale, 2.0f / w, -2.0f / h);
        gl.Uniform2f(m_Program->offset, -1.0f, 1.0f);
    }
    gl.Uniform1i(m_Program->texture, 0);
    gl.Uniform3i(m_Program->colorOp, static_cast<GLint>(m_Stage[TssColorOp]),
                 static_cast<GLint>(m_Stage[TssColorArg1]), static_cast<GLint>(m_Stage[TssColorArg2]));
    gl.Uniform3i(m_Program->alphaOp, static_cast<GLint>(m_Stage[TssAlphaOp]),
                 static_cast<GLint>(m_Stage[TssAlphaArg1]), static_cast<GLint>(m_Stage[TssAlphaArg2]));
    m_UniformsDirty = false;
}

DeviceResult CGlBackend::DrawPrimitiveUP(PrimitiveType type, unsigned primitiveCount, const Vertex* vertices,
                                         unsigned vertexCount)
{
    if (!m_Context)
        return ResultInvalidCall;
    auto& gl = *m_Gl;
    PrepareDraw();
    GLsizei count = 0;
    const GLenum mode = PrimitiveToGl(type, primitiveCount, vertexCount, count);
    if (count <= 0)
        return ResultOk;
    gl.BindBuffer(GL_ARRAY_BUFFER, m_Vbo);
    // A fresh store each time: the driver need not wait for the last draw.
    gl.BufferData(GL_ARRAY_BUFFER, static_cast<GLsizeiptr>(vertexCount * sizeof(Vertex)), vertices,
                  GL_STREAM_DRAW);
    gl.DrawArrays(mode, 0, count);
    return ResultOk;
}

CDeviceTexture* CGlBackend::CreateTexture(unsigned width, unsigned height, uint8_t format, bool renderTarget)
{
    FormatInfo info;
    if (!m_Context || width == 0 || height == 0 || !GetFormat(format, info) ||
        (renderTarget && format != FormatA8R8G8B8))
        return nullptr;
    auto& gl = *m_Gl;
    Check("before CreateTexture");
    auto* texture = new Texture();
    texture->Width = width;
    texture->Height = height;
    texture->Format = format;
    texture->RenderTarget = renderTarget;
    gl.GenTextures(1, &texture->id);
    gl.ActiveTexture(GL_TEXTURE0);
    gl.BindTexture(GL_TEXTURE_2D, texture->id);
    gl.TexParameteri(GL_TEXTURE_2D, GL_TEXTURE_MAX_LEVEL, 0);
    if (info.compressed) {
        std::vector<unsigned char> zeros(LevelSize(format, width, height));
        gl.CompressedTexImage2D(GL_TEXTURE_2D, 0, info.internal, static_cast<GLsizei>(width),
                                static_cast<GLsizei>(height), 0, static_cast<GLsizei>(zeros.size()), zeros.data());
    } else {
        gl.TexImage2D(GL_TEXTURE_2D, 0, static_cast<GLint>(info.internal), static_cast<GLsizei>(width),
                      static_cast<GLsizei>(height), 0, info.format, info.type, nullptr);
    }
    bool ok = Check("CreateTexture");
    if (ok && renderTarget) {
        gl.GenFramebuffers(1, &texture->fbo);
        gl.BindFramebuffer(GL_FRAMEBUFFER, texture->fbo);
        gl.FramebufferTexture2D(GL_FRAMEBUFFER, GL_COLOR_ATTACHMENT0, GL_TEXTURE_2D, texture->id, 0);
        ok = gl.CheckFramebufferStatus(GL_FRAMEBUFFER) == GL_FRAMEBUFFER_COMPLETE;
        BindTarget();
    }
    BindStageTexture();
    if (!ok) {
        if (texture->fbo)
            gl.DeleteFramebuffers(1, &texture->fbo);
        gl.DeleteTextures(1, &texture->id);
        delete texture;
        return nullptr;
    }
    m_Textures.insert(texture);
    return texture;
}

void CGlBackend::ReleaseTexture(CDeviceTexture* base)
{
    auto* texture = static_cast<Texture*>(base);
    if (!texture || !m_Textures.erase(texture))
        return;
    if (m_Context) {
        auto& gl = *m_Gl;
        if (m_Bound == texture) {
            m_Bound = nullptr;
            BindStageTexture();
        }
        if (m_Target == texture) {
            m_Target = nullptr;
            BindTarget();
        }
        if (texture->fbo)
            gl.DeleteFramebuffers(1, &texture->fbo);
        if (texture->id)
            gl.DeleteTextures(1, &texture->id);
    }
    delete texture;
}

DeviceResult CGlBackend::LoadBits(CDeviceTexture* base, const void* data, size_t size)
{
    auto* texture = static_cast<Texture*>(base);
    FormatInfo info;
    if (!m_Context || !texture || !texture->id || !GetFormat(texture->Format, info) ||
        size < LevelSize(texture->Format, texture->Width, texture->Height))
        return ResultInvalidCall;
    auto& gl = *m_Gl;
    gl.ActiveTexture(GL_TEXTURE0);
    gl.BindTexture(GL_TEXTURE_2D, texture->id);
    const auto w = static_cast<GLsizei>(texture->Width), h = static_cast<GLsizei>(texture->Height);
    if (info.compressed)
        gl.CompressedTexSubImage2D(GL_TEXTURE_2D, 0, 0, 0, w, h, info.internal,
                                   static_cast<GLsizei>(LevelSize(texture->Format, texture->Width, texture->Height)),
                                   data);
    else
        gl.TexSubImage2D(GL_TEXTURE_2D, 0, 0, 0, w, h, info.format, info.type, data);
    BindStageTexture();
    return Check("LoadBits") ? ResultOk : ResultFail;
}

DeviceResult CGlBackend::ReadTexture(CDeviceTexture* base, uint32_t* out)
{
    auto* texture = static_cast<Texture*>(base);
    if (!m_Context || !texture || !texture->id)
        return ResultInvalidCall;
    auto& gl = *m_Gl;
    gl.ActiveTexture(GL_TEXTURE0);
    gl.BindTexture(GL_TEXTURE_2D, texture->id);
    gl.GetTexImage(GL_TEXTURE_2D, 0, GL_BGRA, GL_UNSIGNED_INT_8_8_8_8_REV, out);
    BindStageTexture();
    return Check("ReadTexture") ? ResultOk : ResultFail;
}

DeviceResult CGlBackend::ReadBackBuffer(const misc::IntRect& area, uint32_t* out)
{
    if (!m_Context || area.Width <= 0 || area.Height <= 0)
        return ResultInvalidCall;
    auto& gl = *m_Gl;
    int drawableW = 0, drawableH = 0;
    SDL_GL_GetDrawableSize(m_Window, &drawableW, &drawableH);
    if (area.X < 0 || area.Y < 0 || area.X + area.Width > drawableW || area.Y + area.Height > drawableH)
        return ResultInvalidCall;
    gl.BindFramebuffer(GL_READ_FRAMEBUFFER, 0);
    gl.ReadBuffer(GL_BACK);
    gl.ReadPixels(area.X, drawableH - area.Y - area.Height, area.Width, area.Height, GL_BGRA,
                  GL_UNSIGNED_INT_8_8_8_8_REV, out);
    gl.BindFramebuffer(GL_READ_FRAMEBUFFER, m_Target ? m_Target->fbo : 0);
    // GL rows run bottom-up.
    const size_t row = static_cast<size_t>(area.Width);
    for (int top = 0, bottom = area.Height - 1; top < bottom; ++top, --bottom)
        std::swap_ranges(out + top * row, out + (top + 1) * row, out + bottom * row);
    return Check("ReadBackBuffer") ? ResultOk : ResultFail;
}

unsigned CGlBackend::CompileProgram(const std::string& fragment, std::string& errors)
{
    auto& gl = *m_Gl;
    auto compile = [&](GLenum kind, const char* source) -> GLuint {
        GLuint shader = gl.CreateShader(kind);
        gl.ShaderSource(shader, 1, &source, nullptr);
        gl.CompileShader(shader);
        GLint ok = 0;
        gl.GetShaderiv(shader, GL_COMPILE_STATUS, &ok);
        if (!ok) {
            char log[2048] = {};
            gl.GetShaderInfoLog(shader, sizeof log, nullptr, log);
            errors += log;
            gl.DeleteShader(shader);
            return 0;
        }
        return shader;
    };
    GLuint vs = compile(GL_VERTEX_SHADER, kVertexShader);
    GLuint fs = compile(GL_FRAGMENT_SHADER, fragment.c_str());
    GLuint program = 0;
    if (vs && fs) {
        program = gl.CreateProgram();
        gl.AttachShader(program, vs);
        gl.AttachShader(program, fs);
        gl.LinkProgram(program);
        GLint ok = 0;
        gl.GetProgramiv(program, GL_LINK_STATUS, &ok);
        if (!ok) {
            char log[2048] = {};
            gl.GetProgramInfoLog(program, sizeof log, nullptr, log);
            errors += log;
            gl.DeleteProgram(program);
            program = 0;
        }
    }
    if (vs)
        gl.DeleteShader(vs);
    if (fs)
        gl.DeleteShader(fs);
    return program;
}

CDeviceShader* CGlBackend::CreatePixelShader(const std::string& source, std::string& errors)
{
    if (!m_Context) {
        errors = "no device";
        return nullptr;
    }
    GLuint id = CompileProgram(source, errors);
    if (!id)
        return nullptr;
    auto& gl = *m_Gl;
    auto* program = new Program();
    program->id = id;
    program->scale = gl.GetUniformLocation(id, "u_Scale");
    program->offset = gl.GetUniformLocation(id, "u_Offset");
    program->texture = gl.GetUniformLocation(id, "u_Texture");
    program->colorOp = gl.GetUniformLocation(id, "u_ColorOp");
    program->alphaOp = gl.GetUniformLocation(id, "u_AlphaOp");
    m_Programs.insert(program);
    return program;
}

void CGlBackend::ReleasePixelShader(CDeviceShader* shader)
{
    auto* program = static_cast<Program*>(shader);
    if (!program || !m_Programs.erase(program))
        return;
    if (m_Context) {
        if (m_Program == program)
            SetPixelShader(nullptr);
        if (program->id)
            m_Gl->DeleteProgram(program->id);
    }
    delete program;
}

} // namespace ox::graphics

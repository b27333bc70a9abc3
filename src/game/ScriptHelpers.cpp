#include "game/ScriptHelpers.h"

#include "diag/Assert.h"
#include "diag/Log.h"
#include "graphics/Renderer.h"
#include "misc/Matrix.h"
#include "misc/Poly.h"
#include "misc/StringTable.h"
#include "misc/Unicode.h"
#include "misc/animation/Clip.h"

#include <SDL.h>

#include <algorithm>
#include <cctype>
#include <cstring>
#include <filesystem>

namespace k17 {

using namespace ox;
using misc::FloatRect;

ClipBorder ComputeClipBorder(misc::FloatVector pos, misc::FloatVector extent, misc::IntVector canvas)
{
    const float w = static_cast<float>(canvas.X), h = static_cast<float>(canvas.Y);
    const float left = std::max(pos.X, 0.0f), top = std::max(pos.Y, 0.0f);
    const float right = std::min(pos.X + extent.X, w), bottom = std::min(pos.Y + extent.Y, h);
    ClipBorder border;
    if (top > 0)
        border.Strips.push_back(FloatRect(0, 0, w, top));
    if (right < 0 || bottom < 0 || left >= w || top >= h)
        return border;
    if (left > 0)
        border.Strips.push_back(FloatRect(0, top, left, bottom - top));
    if (right < w)
        border.Strips.push_back(FloatRect(right, top, w, bottom - top));
    if (bottom < h)
        border.Strips.push_back(FloatRect(0, bottom, w, h));
    border.DrawClip = true;
    return border;
}

void RenderBorderedClip(graphics::CRenderer* renderer, misc::anim::CClip* clip, float x, float y,
                        const graphics::Color& color)
{
    OX_CHECK_DATA(renderer != nullptr && clip != nullptr);
    const misc::FloatVector extent = clip->GetSize() - misc::FloatVector(1, 1);
    const ClipBorder border = ComputeClipBorder({x, y}, extent, renderer->GetSourceResolution());
    for (const FloatRect& strip : border.Strips)
        renderer->RenderFilledPoly4(misc::RectToPoly4(strip), color);
    if (!border.DrawClip)
        return;
    // The clip's origin is its centre.
    renderer->PushState();
    renderer->SetColor(color);
    renderer->ApplyMatrix(misc::MatrixTranslation(extent.X / 2.0f + x, extent.Y / 2.0f + y));
    clip->Draw(renderer);
    renderer->PopState();
}

int CharToInt(char c) { return static_cast<signed char>(c); }

wstring GetString(int id)
{
    const wchar* text = misc::CStringTable::Instance().GetString(id);
    return text ? wstring(text) : wstring();
}

namespace {

DocumentOpener& Opener()
{
    static DocumentOpener opener;
    return opener;
}

void OpenWithDesktop(const std::string& url)
{
    if (SDL_OpenURL(url.c_str()) != 0)
        OX_LOG("app", diag::LogWarning, "cannot open %s: %s", url.c_str(), SDL_GetError());
}

} // namespace

std::string FileUrl(const std::string& path)
{
    static const char kHex[] = "0123456789ABCDEF";
    std::string url = "file://";
    for (unsigned char c : path) {
        if (std::isalnum(c) || std::strchr("/-._~", c))
            url += static_cast<char>(c);
        else
            url += {'%', kHex[c >> 4], kHex[c & 15]};
    }
    return url;
}

void SetDocumentOpener(DocumentOpener opener) { Opener() = std::move(opener); }

void ExecuteFile(const wstring& path)
{
    std::error_code error;
    const std::filesystem::path file(misc::WideToUtf8(path));
    if (path.empty() || !std::filesystem::exists(file, error))
        return;
    const std::string url = FileUrl(std::filesystem::absolute(file, error).string());
    if (Opener())
        Opener()(url);
    else
        OpenWithDesktop(url);
}

} // namespace k17

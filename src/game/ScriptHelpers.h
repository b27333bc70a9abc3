#pragma once
// The small helpers of the game's script vocabulary: a clip drawn with the canvas around it
// covered, a character's signed value, a text of the string table, and opening a document
// with the desktop's program.
#include "misc/Rect.h"
#include "misc/Vector.h"
#include "misc/WideChar.h"

#include <functional>
#include <string>
#include <vector>

namespace ox::graphics {
class CRenderer;
struct Color;
}
namespace ox::misc::anim {
class CClip;
}

namespace k17 {

// What covers the canvas (`canvas` wide and high) round a clip whose top left corner is at
// `pos` and whose drawn extent is `extent` (its size less one): the strips to fill, top,
// left, right and bottom, and whether the clip shows at all. Strips may pass beyond the
// canvas; the renderer clips them.
struct ClipBorder {
    std::vector<ox::misc::FloatRect> Strips;
    bool DrawClip = false;
};
ClipBorder ComputeClipBorder(ox::misc::FloatVector pos, ox::misc::FloatVector extent, ox::misc::IntVector canvas);

// Draws `clip` with its top left corner at (x, y) and fills the rest of the canvas with
// `color`, so that a moved or small full-screen clip leaves no strip uncovered.
void RenderBorderedClip(ox::graphics::CRenderer* renderer, ox::misc::anim::CClip* clip, float x, float y,
                        const ox::graphics::Color& color);

// The value of a character, sign-extended from 8 bits: a byte above 127 is negative.
int CharToInt(char c);

// The text of `id` in the string table, copied.
ox::wstring GetString(int id);

// Hands an existing file to the desktop's default program; a missing file does nothing.
void ExecuteFile(const ox::wstring& path);
// The "file://" address of an absolute path, with the bytes an address may not hold escaped.
std::string FileUrl(const std::string& path);
// Who opens an address (SDL_OpenURL by default); tests put a recorder here. Empty: default.
using DocumentOpener = std::function<void(const std::string& url)>;
void SetDocumentOpener(DocumentOpener opener);

} // namespace k17

#pragma once
// A level's brief state in a player's save file: the flags, hints and colours of its objects,
// written with the level's brief XML form and put back by id onto a level fresh from the
// quest data, so a game continues where the player left it.
#include "misc/WideChar.h"

#include <cstdint>

namespace ox::gui {
class CBaseWindow;
}
namespace qe {
class CLevel;
}

namespace k17 {

// Writes <save> with the level's brief form to `path` through a temporary file. False
// (logged) when it cannot be written.
bool SaveLevelState(const qe::CLevel* level, const ox::wstring& path);
// Reads the brief form of the level of the same id from `path` and gives each object of
// `level` found by id the saved object flags, hint and colour. False (logged) when there is
// no save or it holds no such level; objects the save does not know keep their state.
bool RestoreLevelState(qe::CLevel* level, const ox::wstring& path);

// One hash of the brief forms of the levels whose scenes the windows from `window` up its
// child windows show, each level once, in the order met: the state a replay check compares.
// 0 when no level is shown.
uint32_t HashShownLevelState(const ox::gui::CBaseWindow* window);

} // namespace k17

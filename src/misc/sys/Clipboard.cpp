#include "misc/sys/Clipboard.h"

#include "diag/Assert.h"
#include "misc/Unicode.h"

#include <SDL.h>

namespace ox::misc::sys {

namespace {
bool VideoReady()
{
    bool ready = SDL_WasInit(SDL_INIT_VIDEO) != 0;
    OX_ASSERT(ready && "the clipboard needs the window");
    return ready;
}
} // namespace

bool GetClipboardText(wstring& out)
{
    out.clear();
    if (!VideoReady() || !SDL_HasClipboardText())
        return false;
    char* text = SDL_GetClipboardText();
    if (!text)
        return false;
    out = Utf8ToWide(text);
    SDL_free(text);
    return true;
}

bool SetClipboardText(const wstring& text)
{
    if (!VideoReady())
        return false;
    return SDL_SetClipboardText(WideToUtf8(text).c_str()) == 0;
}

} // namespace ox::misc::sys

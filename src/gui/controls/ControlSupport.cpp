#include "gui/controls/ControlSupport.h"

#include "core/SettingsReaders.h"
#include "graphics/Renderer.h"
#include "graphics/Texture.h"
#include "gui/Description.h"
#include "gui/GuiServices.h"
#include "gui/Widget.h"

#include <cmath>
#include <cstdio>
#include <cstdlib>

namespace ox::gui {

const core::CSettingsGroup& FindTemplate(const core::CSettingsGroup& node, const core::CSettingsGroup& templates,
                                         const char* kind)
{
    const std::string& id = node.GetValue(kind);
    if (id.empty())
        return core::CSettingsGroup::Empty();
    const core::CSettingsGroup& found = templates.GetChildByAttribute(kind, "id", id);
    if (&found == &core::CSettingsGroup::Empty())
        ReportElement(node, "no such template, defaults used: ", std::string(kind) + " \"" + id + "\"");
    return found;
}

const graphics::CFont* ReadFont(const core::CSettingsGroup& owner, const char* key)
{
    const std::string& id = owner.GetValue(key);
    if (id.empty())
        return nullptr;
    const auto& find = GetGuiServices().findFont;
    const graphics::CFont* font = find ? find(id.c_str()) : nullptr;
    if (!font)
        ReportElement(owner, "no such font, the text is not drawn: ", std::string(key) + "=\"" + id + "\"");
    return font;
}

bool ReadImage(const core::CSettingsGroup& owner, const char* key, graphics::CImage& image)
{
    image.Init();
    const std::string& id = owner.GetValue(key);
    if (id.empty())
        return false;
    image.SetTexture(id.c_str());
    if (!image.HasTexture())
        ReportElement(owner, "no such texture, not drawn: ", std::string(key) + "=\"" + id + "\"");
    return image.HasTexture();
}

std::string ReadSound(const core::CSettingsGroup& owner, const char* key)
{
    const std::string& id = owner.GetValue(key);
    const auto& known = GetGuiServices().isSound;
    if (!id.empty() && known && !known(id))
        ReportElement(owner, "no such sound, silent: ", std::string(key) + "=\"" + id + "\"");
    return id;
}

bool ReadFlag(const core::CSettingsGroup& node, const char* name, bool& value)
{
    if (!node.IsValue(name))
        return false;
    const std::string& text = node.GetValue(name);
    if (text == "true" || text == "1" || text == "false" || text == "0") {
        value = text == "true" || text == "1";
        return true;
    }
    ReportElement(node, "not true or false, ignored: ", std::string(name) + "=\"" + text + "\"");
    return false;
}

bool ReadColorChecked(const core::CSettingsGroup& node, const char* name, graphics::Color& value)
{
    if (!node.IsValue(name))
        return false;
    // "#a r g b" or a decimal 0xAARRGGBB number.
    const std::string& text = node.GetValue(name);
    short channels[4];
    char* end = nullptr;
    const bool readable = text[0] == '#'
                              ? sscanf(text.c_str(), "#%hi %hi %hi %hi", &channels[0], &channels[1], &channels[2],
                                       &channels[3]) == 4
                              : (strtoll(text.c_str(), &end, 10), end && end != text.c_str() && *end == 0);
    if (!readable) {
        ReportElement(node, "not a colour, ignored: ", std::string(name) + "=\"" + text + "\"");
        return false;
    }
    value = core::ParseSettingsColor(text);
    return true;
}

bool ReadSeconds(const core::CSettingsGroup& node, const char* name, unsigned& milliseconds)
{
    float seconds = 0;
    if (!ReadChecked(node, name, seconds, 0.0f, 3600.0f))
        return false;
    milliseconds = static_cast<unsigned>(std::lround(seconds * 1000.0f));
    return true;
}

unsigned ParseJustification(const std::string& words)
{
    auto has = [&words](const char* word) { return words.find(word) != std::string::npos; };
    using R = graphics::CRenderer;
    unsigned flags = 0;
    if (has("left"))
        flags |= R::TextLeft;
    else if (has("right"))
        flags |= R::TextRight;
    else if (has("center"))
        flags |= R::TextCenterH;
    if (has("top"))
        flags |= R::TextTop;
    else if (has("bottom"))
        flags |= R::TextBottom;
    else if (has("center"))
        flags |= R::TextCenterV;
    return flags;
}

void TellParent(CWidget& sender, const char* action)
{
    CBaseWidget* parent = sender.GetParentWidget();
    if (!parent)
        return;
    WidgetPtrT held(&sender);
    parent->OnChildAction(action, &sender);
}

void TakeNaturalSize(CWidget& widget, const misc::FloatVector& natural)
{
    const misc::FloatVector size = widget.GetSize();
    const bool noWidth = size.X < 0.001f, noHeight = size.Y < 0.001f;
    if (noWidth || noHeight)
        widget.SetSize(noWidth ? natural.X : size.X, noHeight ? natural.Y : size.Y);
}

bool IsInside(const CWidget& widget, const misc::IntVector& pos)
{
    const misc::FloatVector& size = widget.GetSize();
    return pos.X >= 0 && pos.Y >= 0 && static_cast<float>(pos.X) < size.X && static_cast<float>(pos.Y) < size.Y;
}

misc::ShortRect StripPart(const graphics::CTexture& texture, int index, int count)
{
    const graphics::CSurface* surface = texture.GetSurface();
    const graphics::UVRect uv = texture.GetSurfaceRect();
    const float sw = surface ? surface->GetWidth() : 0, sh = surface ? surface->GetHeight() : 0;
    const float width = (uv.u2 - uv.u1) * sw / static_cast<float>(count);
    return misc::ShortRect(static_cast<int16_t>(std::lround(uv.u1 * sw + width * static_cast<float>(index))),
                           static_cast<int16_t>(std::lround(uv.v1 * sh)), static_cast<int16_t>(std::lround(width)),
                           static_cast<int16_t>(std::lround((uv.v2 - uv.v1) * sh)));
}

unsigned TimerNow(const core::CTimerWrapper& timer) { return timer.Get() ? timer.Get()->GetTime() : 0; }

} // namespace ox::gui

#include "gui/GuiServices.h"

#include "diag/Log.h"
#include "misc/Unicode.h"

#include <set>

namespace ox::gui {

namespace {

// Says once per name that something asked for is missing.
void LogOnce(std::set<std::string>& said, const char* what, const std::string& name, const char* outcome)
{
    if (said.insert(name).second)
        OX_LOG("gui", diag::LogWarning, "%s \"%s\": %s", what, name.c_str(), outcome);
}

} // namespace

GuiServices& GetGuiServices()
{
    static auto* services = new GuiServices();
    return *services;
}

void PlayGuiSound(const std::string& id)
{
    if (id.empty())
        return;
    static std::set<std::string> said;
    if (const auto& play = GetGuiServices().playSound)
        play(id);
    else
        LogOnce(said, "sound", id, "no audio is connected, silent");
}

EffectPtrT CreateGuiEffect(const wstring& name)
{
    static std::set<std::string> said;
    const auto& create = GetGuiServices().createEffect;
    EffectPtrT effect = create ? create(name) : EffectPtrT();
    if (!effect)
        LogOnce(said, "effect", misc::WideToUtf8(name), "no such effect, skipped");
    return effect;
}

} // namespace ox::gui

#pragma once
// Script names of the audio manager. Run in declaration mode and merge the result under
// "ox": core.CAudioManager, with CAudioManager.Instance for the game's manager.
#include "lua/mluabind/Binding.h"

namespace ox::sound {

// "core": CAudioManager with IsAudioAvailable, PauseAll, GetGlobalVolume, SetGlobalVolume,
// SetVolume and GetVolume (by id or handle), GetMaxVolume, GetPosition, SetPosition,
// GetPriority, GetRepeatCount, GetBalance, GetSpeed, GetLength (by id), Play, StopAll, Stop
// and IsSound (by id or handle), SetGroupVolume, GetGroupVolume, StopGroup and
// UnloadAllOnDemandSounds; ids and groups are strings, handles numbers.
mluabind::Namespace BindAudioManager();

// The audio vocabulary: ox.core.CAudioManager and the sound namespace ox.sound, a table with
// no names of its own. Binds in declaration mode.
void BindSound(mluabind::CHost& host);

} // namespace ox::sound

#pragma once
// oxdump's quest commands: compiling properties/quest.xml into properties/quest.bindump with
// the game's own compiler, and describing a quest dump.
#include <cstddef>
#include <cstdint>

namespace oxdump {

extern const char* const kQuestHelp;

// oxdump quest <quest.xml> <quest.bindump>
int Quest(int argc, char** argv);
// Prints the levels and scenes of a quest dump; false when its blocks don't hold together.
bool ShowQuest(const uint8_t* data, size_t size, const char* name);

} // namespace oxdump

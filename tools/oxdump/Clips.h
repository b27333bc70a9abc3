#pragma once
// oxdump's clip commands: compiling the XML form into properties/clips.bindump, and
// describing a clips dump.
#include <cstddef>
#include <cstdint>

namespace oxdump {

extern const char* const kClipsHelp;

// oxdump clips <clips.xml|folder> <out>
int Clips(int argc, char** argv);
// Prints the clips of a dump after the game's checks; false when the dump is refused.
bool ShowClips(const uint8_t* data, size_t size, const char* name);

} // namespace oxdump

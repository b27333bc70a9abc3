#pragma once
// oxdump's particle commands: compiling the XML form into properties/particles.bindump, and
// describing a particles dump.
#include <cstddef>
#include <cstdint>

namespace oxdump {

extern const char* const kParticlesHelp;

// oxdump particles <particle.xml|folder> <out>
int Particles(int argc, char** argv);
// Prints the records of a dump after the game's checks; false when the dump is refused.
bool ShowParticles(const uint8_t* data, size_t size, const char* name);

} // namespace oxdump

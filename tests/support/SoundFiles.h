#pragma once
// Ogg files for the audio tests, made with the program's own encoder: tones, and the odd
// shapes a game's data can have (several streams, no end mark, foreign streams).
#include "sound/VorbisWriter.h"

#include <cstdint>
#include <string>
#include <vector>

namespace oxtest {

// A sine tone of `frames` frames encoded as Ogg Vorbis.
std::vector<uint8_t> MakeToneOgg(int channels, int rate, size_t frames, double frequency = 440.0,
                                 double amplitude = 0.5, const ox::sound::VorbisEncodeOptions& options = {});
// The pages of an Ogg file, each as its bytes.
std::vector<std::vector<uint8_t>> OggPages(const std::vector<uint8_t>& file);
// An Ogg stream of the given packets (the first begins the stream, the last ends it).
std::vector<uint8_t> MakeOggOfPackets(int serial, const std::vector<std::string>& packets);
// The pages of `first` and `second` taken in turn, one of each.
std::vector<uint8_t> InterleavePages(const std::vector<uint8_t>& first, const std::vector<uint8_t>& second);

std::string AsString(const std::vector<uint8_t>& bytes);

} // namespace oxtest

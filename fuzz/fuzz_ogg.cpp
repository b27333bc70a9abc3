// Feeds arbitrary bytes to the Ogg Vorbis stream: open, length, reads to the end, a seek
// and a rewind, on an exact-size copy so that the address sanitizer sees any read past the
// data. Each input is tried once more with the checksum of every page made right, so that
// changed bytes inside pages reach the Vorbis decoder instead of being dropped by the sync
// layer. The first byte picks the read size and the seek time.
#include "sound/OggVorbisStream.h"

#include <ogg/ogg.h>

#include <cstdint>
#include <cstring>
#include <memory>
#include <vector>

using ox::sound::COggVorbisStream;

namespace {

volatile uint32_t g_Sink;

void Exercise(const uint8_t* data, size_t size)
{
    std::unique_ptr<uint8_t[]> copy(new uint8_t[size ? size : 1]);
    if (size)
        memcpy(copy.get(), data, size);
    COggVorbisStream stream;
    if (!stream.OpenMemory(copy.get(), static_cast<unsigned>(size), "fuzz.ogg"))
        return;
    const unsigned block = 2 + (size ? data[0] : 0) * 64;
    std::vector<uint8_t> buffer(block);
    const double length = stream.GetLength();
    uint32_t sum = length > 0.0 && length < 1e6 ? static_cast<uint32_t>(length) : 0;
    // A bounded number of reads: a stream of damaged pages may give little at a time.
    for (int i = 0; i < 4096; ++i) {
        const unsigned got = stream.Read(buffer.data(), block);
        if (got > block || (got & 1))
            __builtin_trap();
        if (got == 0)
            break;
        sum += buffer[got - 1];
    }
    if (length > 0.0 && length < 1e6)
        stream.Seek(length * (size ? data[0] : 0) / 255.0);
    stream.Read(nullptr, block);
    if (stream.Rewind())
        sum += stream.Read(buffer.data(), block);
    g_Sink = sum;
}

// The checksums of all whole pages made right.
void RepairPages(std::vector<uint8_t>& bytes)
{
    for (size_t at = 0; at + 27 <= bytes.size(); ++at) {
        if (memcmp(bytes.data() + at, "OggS", 4) != 0)
            continue;
        const size_t segments = bytes[at + 26];
        if (at + 27 + segments > bytes.size())
            return;
        size_t body = 0;
        for (size_t s = 0; s < segments; ++s)
            body += bytes[at + 27 + s];
        if (at + 27 + segments + body > bytes.size())
            return;
        ogg_page page;
        page.header = bytes.data() + at;
        page.header_len = static_cast<long>(27 + segments);
        page.body = bytes.data() + at + 27 + segments;
        page.body_len = static_cast<long>(body);
        ogg_page_checksum_set(&page);
        at += 27 + segments + body - 1;
    }
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    Exercise(data, size);
    std::vector<uint8_t> repaired(data, data + size);
    RepairPages(repaired);
    Exercise(repaired.data(), repaired.size());
    return 0;
}

// Feeds arbitrary bytes to the clips: as a clips.bindump (checked, then every clip it
// hands out built into running objects, played and jumped through time) and as clip XML
// (converted; what the converter makes must pass the game's checks and load the same way).
// The dump is tried once more with its magic set, so that the checks behind it are reached.
#include "core/TimeManager.h"
#include "misc/animation/Clip.h"
#include "misc/animation/ClipServices.h"
#include "misc/animation/ClipsLoader.h"

#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <vector>

using namespace ox::misc::anim;

namespace {

// The clips run on a clock that stands still: times move only by SetTime and MoveTime.
void UseStillClock()
{
    static auto* time = new ox::core::CTimeManager([] { return 0.0; });
    GetClipServices().time = time;
}

void Run(const CClipsLoader& loader)
{
    const uint32_t count = loader.Count() < 16 ? loader.Count() : 16;
    for (uint32_t i = 0; i < count; ++i) {
        if (!loader.IsUsable(i))
            continue;
        CClip clip;
        if (!clip.Load(loader, loader.Table()[i].id.c_str()))
            __builtin_trap();  // a usable clip of the table must load
        clip.Update();
        clip.MoveTime(300, true);
        clip.Stop();
        clip.SetTime(99999, true);
        CClip copy(clip);
        copy.Play();
        copy.MoveTime(100000, true);
    }
}

void TryDump(const uint8_t* data, size_t size)
{
    // An exact-size, 4-aligned copy: the sanitizer sees any read past the end.
    void* copy = aligned_alloc(4, (size + 3) / 4 * 4 + 4);
    memcpy(copy, data, size);
    {
        CClipsLoader loader;
        if (loader.LoadFromMemory(copy, size, "fuzz.bindump"))
            Run(loader);
    }
    free(copy);
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    UseStillClock();
    TryDump(data, size);
    if (size >= 8) {
        std::vector<uint8_t> repaired(data, data + size);
        memcpy(repaired.data(), &kClipsMagic, 4);
        TryDump(repaired.data(), repaired.size());
    }
    ClipRecords records;
    if (ConvertClipsXml(reinterpret_cast<const char*>(data), size, "fuzz.xml", records)) {
        CClipsLoader converted;
        if (!converted.LoadRecords(records))
            __builtin_trap();  // what the converter makes, the game must accept
        for (uint32_t i = 0; i < converted.Count(); ++i)
            if (!converted.IsUsable(i))
                __builtin_trap();
        Run(converted);
    }
    return 0;
}

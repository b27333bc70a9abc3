// The Ogg Vorbis stream on files made by our own encoder: exact sample counts, the decoded
// samples against the tone they were made from, rewind, seek and length, and the files a
// game's data can get wrong.
#include "misc/GamePack.h"
#include "sound/OggVorbisStream.h"
#include "support/SoundFiles.h"
#include "support/TestSupport.h"

#include <ogg/ogg.h>

#include <climits>
#include <cmath>
#include <cstring>

using namespace ox::sound;
using oxtest::MakeToneOgg;

namespace {

// Reads the whole stream in blocks of `block` bytes; the sizes of the reads go to `sizes`.
std::vector<int16_t> ReadAll(COggVorbisStream& stream, unsigned block, std::vector<unsigned>* sizes = nullptr)
{
    std::vector<int16_t> pcm;
    std::vector<int16_t> buffer(block / 2);
    while (unsigned got = stream.Read(buffer.data(), block)) {
        pcm.insert(pcm.end(), buffer.begin(), buffer.begin() + got / 2);
        if (sizes)
            sizes->push_back(got);
    }
    return pcm;
}

struct OpenedStream {
    std::vector<uint8_t> file;
    COggVorbisStream stream;
    explicit OpenedStream(std::vector<uint8_t> bytes, const char* name = "test.ogg") : file(std::move(bytes))
    {
        stream.OpenMemory(file.data(), static_cast<unsigned>(file.size()), name);
    }
};

} // namespace

TEST(OggVorbisStream, StereoFileGivesExactBlocksAndTheTonesSamples)
{
    OpenedStream s(MakeToneOgg(2, 44100, 44100, 440.0, 0.5));
    ASSERT_TRUE(s.stream.IsOpen());
    EXPECT_TRUE(s.stream.IsStereo());
    EXPECT_EQ(s.stream.GetRate(), 44100);
    EXPECT_DOUBLE_EQ(s.stream.GetLength(), 1.0);

    std::vector<unsigned> sizes;
    std::vector<int16_t> pcm = ReadAll(s.stream, 8192, &sizes);
    ASSERT_EQ(sizes.size(), 22u);
    EXPECT_EQ(sizes[0], 8192u);
    EXPECT_EQ(sizes[20], 8192u);
    EXPECT_EQ(sizes[21], 176400u - 21 * 8192);
    EXPECT_TRUE(s.stream.IsReadAllPcmData());
    EXPECT_EQ(s.stream.Read(nullptr, 8192), 0u);

    // Within the codec's error of what was encoded, in both channels.
    std::vector<int16_t> tone = ox::sound::SynthesiseTone(440.0, 44100, 2, 44100, 0.5);
    double error = 0, signal = 0;
    for (size_t i = 0; i < pcm.size(); ++i) {
        error += std::pow(pcm[i] - tone[i], 2.0);
        signal += std::pow(tone[i], 2.0);
    }
    EXPECT_LT(std::sqrt(error / signal), 0.02);

    // Rewind gives the same samples again, byte for byte.
    ASSERT_TRUE(s.stream.Rewind());
    EXPECT_EQ(ReadAll(s.stream, 5000), pcm);
}

TEST(OggVorbisStream, MonoFileAndDiscardingReadsCountTheSame)
{
    OpenedStream s(MakeToneOgg(1, 22050, 1000));
    ASSERT_TRUE(s.stream.IsOpen());
    EXPECT_FALSE(s.stream.IsStereo());
    EXPECT_DOUBLE_EQ(s.stream.GetLength(), 1000.0 / 22050);
    EXPECT_EQ(ReadAll(s.stream, 8192).size(), 1000u);
    ASSERT_TRUE(s.stream.Rewind());
    unsigned total = 0;
    while (unsigned got = s.stream.Read(nullptr, 333))
        total += got;
    EXPECT_EQ(total, 2000u);
    // A read too small for one frame of a stereo file moves nothing but keeps the stream.
    OpenedStream stereo(MakeToneOgg(2, 8000, 100));
    EXPECT_EQ(stereo.stream.Read(nullptr, 3), 0u);
    EXPECT_FALSE(stereo.stream.IsReadAllPcmData());
}

TEST(OggVorbisStream, SeekLandsWithinABlockAndLengthNeedsNoEndMark)
{
    const int rate = 44100;
    OpenedStream s(MakeToneOgg(2, rate, 2 * rate));
    ASSERT_TRUE(s.stream.IsOpen());
    EXPECT_FALSE(s.stream.Seek(0.0005));
    ASSERT_TRUE(s.stream.Seek(0.5));
    const double left = ReadAll(s.stream, 8192).size() / 2.0;
    EXPECT_NEAR(left, 1.5 * rate, 2048);
    EXPECT_DOUBLE_EQ(s.stream.GetLength(), 2.0);

    // Without the end-of-stream flag the last page found gives the length: in a file of
    // several chunks and in one smaller than a chunk.
    ox::sound::VorbisEncodeOptions noEnd;
    noEnd.endOfStream = false;
    OpenedStream big(MakeToneOgg(2, rate, 5 * rate, 440.0, 0.5, noEnd));
    ASSERT_GT(big.file.size(), 2u * COggIterator::kChunkSize);
    EXPECT_DOUBLE_EQ(big.stream.GetLength(), 5.0);
    OpenedStream small(MakeToneOgg(1, 8000, 800, 440.0, 0.5, noEnd));
    ASSERT_LT(small.file.size(), COggIterator::kChunkSize);
    EXPECT_DOUBLE_EQ(small.stream.GetLength(), 0.1);
    EXPECT_EQ(ReadAll(small.stream, 8192).size(), 800u);
}

TEST(OggVorbisStream, SeveralLogicalStreamsPlayOnlyTheFirstVorbisStream)
{
    oxtest::LogCapture log;
    ox::sound::VorbisEncodeOptions second;
    second.serial = 2;
    std::vector<uint8_t> chained = MakeToneOgg(1, 8000, 4000);
    std::vector<uint8_t> more = MakeToneOgg(1, 8000, 1500, 660.0, 0.5, second);
    chained.insert(chained.end(), more.begin(), more.end());
    OpenedStream c(chained, "chained.ogg");
    ASSERT_TRUE(c.stream.IsOpen());
    EXPECT_EQ(ReadAll(c.stream, 8192).size(), 4000u);
    EXPECT_TRUE(log.Contains("chained.ogg holds several logical streams"));

    // A foreign stream first, its pages between those of the Vorbis stream.
    std::vector<uint8_t> foreign = oxtest::MakeOggOfPackets(7, {"\x80theora-ish", "data", "more", "end"});
    OpenedStream m(oxtest::InterleavePages(foreign, MakeToneOgg(2, 8000, 3000)), "muxed.ogg");
    ASSERT_TRUE(m.stream.IsOpen());
    EXPECT_EQ(ReadAll(m.stream, 8192).size(), 6000u);
    EXPECT_TRUE(log.Contains("muxed.ogg holds several logical streams"));
}

TEST(OggVorbisStream, FilesThatCannotPlayAreLoggedByName)
{
    oxtest::LogCapture log;
    struct Case {
        const char* name;
        std::vector<uint8_t> bytes;
        const char* reason;
    };
    std::vector<uint8_t> garbage(5000);
    for (size_t i = 0; i < garbage.size(); ++i)
        garbage[i] = static_cast<uint8_t>(i * 7919 >> 3);
    std::vector<uint8_t> headersOnly = MakeToneOgg(2, 8000, 800);
    headersOnly.resize(oxtest::OggPages(headersOnly)[0].size() + 10);
    Case cases[] = {
        {"three.ogg", MakeToneOgg(3, 8000, 800), "it has more than two channels"},
        {"foreign.ogg", oxtest::MakeOggOfPackets(3, {"not", "vorbis"}), "it holds no Vorbis stream"},
        {"garbage.ogg", garbage, "it holds no Vorbis stream"},
        {"empty.ogg", {}, "it is empty"},
        {"cut.ogg", headersOnly, "it ends inside its Vorbis headers"},
    };
    for (Case& c : cases) {
        SCOPED_TRACE(c.name);
        COggVorbisStream stream;
        EXPECT_FALSE(stream.OpenMemory(c.bytes.data(), static_cast<unsigned>(c.bytes.size()), c.name));
        EXPECT_FALSE(stream.IsOpen());
        EXPECT_TRUE(stream.IsReadAllPcmData());
        EXPECT_EQ(stream.Read(nullptr, 8192), 0u);
        EXPECT_TRUE(log.Contains(std::string("sound file ") + c.name + " does not play: " + c.reason));
    }
}

TEST(OggVorbisStream, DamagedAudioPlaysWhatIsLeft)
{
    oxtest::LogCapture log;
    const std::vector<uint8_t> good = MakeToneOgg(2, 44100, 8 * 44100);
    const auto pages = oxtest::OggPages(good);
    ASSERT_GE(pages.size(), 6u);
    auto granule = [&](size_t page) {
        int64_t g;
        memcpy(&g, pages[page].data() + 6, 8);
        return g;
    };
    // Cut inside page 4: the whole pages before it play, up to the granule of page 3.
    std::vector<uint8_t> cut;
    for (size_t p = 0; p < 4; ++p)
        cut.insert(cut.end(), pages[p].begin(), pages[p].end());
    cut.insert(cut.end(), pages[4].begin(), pages[4].begin() + pages[4].size() / 2);
    OpenedStream c(cut, "cut.ogg");
    ASSERT_TRUE(c.stream.IsOpen());
    EXPECT_NEAR(ReadAll(c.stream, 8192).size() / 2.0, granule(3), 2048);
    EXPECT_TRUE(log.Contains("sound file cut.ogg ends without an end-of-stream page"));

    // Bytes changed inside page 3: it fails its checksum and its samples are lost.
    std::vector<uint8_t> damaged = good;
    const size_t page3 = pages[0].size() + pages[1].size() + pages[2].size();
    for (size_t i = page3 + 100; i < page3 + pages[3].size(); i += 97)
        damaged[i] ^= 0x5A;
    OpenedStream d(damaged, "damaged.ogg");
    ASSERT_TRUE(d.stream.IsOpen());
    const double lost = 8 * 44100 - ReadAll(d.stream, 8192).size() / 2.0;
    EXPECT_NEAR(lost, granule(3) - granule(2), 2048);
    EXPECT_TRUE(d.stream.IsReadAllPcmData());
}

TEST(OggVorbisStream, OpensFilesOfThePackAndNamesAMissingOne)
{
    oxtest::TempDir dir;
    dir.Write("sounds/beep.ogg", oxtest::AsString(MakeToneOgg(1, 8000, 400)));
    ox::misc::GamePackConfig config;
    config.folder = dir.Path().string();
    config.language = "";
    ox::misc::CGamePack pack(config);
    oxtest::LogCapture log;
    COggVorbisStream stream(COggIterator::kChunkSize, &pack);
    ASSERT_TRUE(stream.Open("sounds/beep.ogg"));
    EXPECT_EQ(ReadAll(stream, 8192).size(), 400u);
    EXPECT_FALSE(stream.Open("sounds/nothere.ogg"));
    EXPECT_FALSE(stream.IsOpen());
    EXPECT_TRUE(log.Contains("sound file sounds/nothere.ogg is missing"));
}

TEST(OggVorbisStream, SeekingInAFileOfDamagedGranulesStaysInRange)
{
    // Every page claims a position far below zero (checksums made right): a seek finds no
    // sensible page, must not overflow, and decodes on from the start.
    std::vector<uint8_t> file = MakeToneOgg(2, 8000, 16000);
    auto pages = oxtest::OggPages(file);
    file.clear();
    for (size_t p = 0; p < pages.size(); ++p) {
        const int64_t granule = INT64_MIN / 3 + static_cast<int64_t>(p);
        memcpy(pages[p].data() + 6, &granule, 8);
        ogg_page page {pages[p].data(), 27 + pages[p][26], pages[p].data() + 27 + pages[p][26],
                       static_cast<long>(pages[p].size() - 27 - pages[p][26])};
        ogg_page_checksum_set(&page);
        file.insert(file.end(), pages[p].begin(), pages[p].end());
    }
    oxtest::LogCapture log;
    OpenedStream s(file, "granules.ogg");
    ASSERT_TRUE(s.stream.IsOpen());
    s.stream.Seek(0.5);
    EXPECT_FALSE(log.Contains("pcm_bytes_to_skip"));
    EXPECT_FALSE(s.stream.Seek(1e300));
}

// The clip bulk: records against hand-written bytes, XML to dump to loader, the order of
// the sources, and dumps and documents that are broken.
#include "misc/GamePack.h"
#include "misc/animation/ClipsLoader.h"
#include "support/TestSupport.h"

#include <cstring>

using namespace ox::misc::anim;
using ox::misc::CGamePack;

namespace {

// Little-endian bytes written by hand, field by field, as a file would hold them.
struct Bytes {
    std::vector<uint8_t> data;

    Bytes& U32(uint32_t v) { return Raw(&v, 4); }
    Bytes& F32(float v) { return Raw(&v, 4); }
    Bytes& U8(uint8_t v) { return Raw(&v, 1); }
    Bytes& Raw(const void* p, size_t n)
    {
        data.insert(data.end(), static_cast<const uint8_t*>(p), static_cast<const uint8_t*>(p) + n);
        return *this;
    }
    Bytes& Zeros(size_t n)
    {
        data.insert(data.end(), n, 0);
        return *this;
    }
    // A fixed string: size, capacity, hash, two unused bytes, then the text padded to n bytes.
    Bytes& Str(const std::string& text, uint16_t n)
    {
        const uint16_t head[4] = {static_cast<uint16_t>(text.size()), n, ox::misc::CalcHash(text.data(), text.size()), 0};
        Raw(head, 8);
        Raw(text.data(), text.size());
        return Zeros(n - text.size());
    }
    Bytes& Colour(int16_t r, int16_t g, int16_t b, int16_t a)
    {
        const int16_t c[4] = {r, g, b, a};
        return Raw(c, 8);
    }
    // An aligned copy, as a mapping would give it.
    std::vector<uint32_t> Words() const
    {
        std::vector<uint32_t> words((data.size() + 3) / 4, 0);
        memcpy(words.data(), data.data(), data.size());
        return words;
    }
};

// An image object "sun" showing "tex_sun" with two keys and a sound at the second key.
Bytes ImageObject()
{
    Bytes b;
    b.U32(276 + 96 + 2 * 72 + 100).U32(ImageType).Str("sun", 88);
    b.F32(10).F32(20);                                  // position
    for (float v : {0.f, 0.f, 8.f, 0.f, 8.f, 8.f, 0.f, 8.f})
        b.F32(v);                                       // contour
    b.F32(0.5f).Colour(255, 128, 0, 255).U32(1).U32(7).U32(1).U32(0);
    b.Str("", 88).U8(0).U8(1).U8(1).U8(2).U8(1).Zeros(3);
    b.Str("tex_sun", 88);
    for (int32_t t : {0, 500}) {
        b.U32(t).F32(t / 10.0f).F32(0).F32(0).Zeros(32).F32(0).Colour(0, 0, 0, 255).U32(0).U32(0).U8(1).Zeros(3);
    }
    b.U32(500).Str("chime", 88);
    return b;
}

Bytes OneClipDump(const Bytes& object, uint32_t magic = kClipsMagic)
{
    Bytes b;
    b.U32(magic).U32(1).Str("dawn", 88).U32(108);
    const uint32_t size = 116 + static_cast<uint32_t>(object.data.size()) + 4;
    b.U32(size).Str("dawn", 88).F32(1).F32(2).F32(300).F32(200);
    b.Raw(object.data.data(), object.data.size()).U32(0);
    return b;
}

const char* kDawnXml = R"(<?xml version="1.0"?>
<clips>
  <Clip id="dawn" x="1" y="2" w="300" h="200">
    <image id="sun" i_id="tex_sun" p="10,20" py="0 0 8 0 8 8 0 8" a="0.5" c="4294934528" flip="1"
           uflags="7" at="1" ad="0" add_b="true" vis="true">
      <kp t="0" itpl="true" p="0,0" c="0xFF000000"/>
      <kp t="500" itpl="true" p="50,0" c="0xFF000000"/>
      <sd k="500" id="chime"/>
    </image>
  </Clip>
  <Clip id="empty"/>
</clips>
)";

CGamePack FolderPack(const oxtest::TempDir& dir)
{
    ox::misc::GamePackConfig config;
    config.folder = dir.Path().string();
    config.language = "";
    return CGamePack(config);
}

} // namespace

TEST(ClipsLoader, HandWrittenRecordsReadInPlace)
{
    const Bytes file = OneClipDump(ImageObject());
    const std::vector<uint32_t> words = file.Words();
    CClipsLoader loader;
    ASSERT_TRUE(loader.LoadFromMemory(words.data(), file.data.size(), "hand"));
    const ClipRecord* clip = loader.FindClip("dawn");
    ASSERT_NE(clip, nullptr);
    EXPECT_EQ(clip->w, 300.0f);
    const ClipObjectBase* object = ObjectsBegin(clip);
    ASSERT_NE(object, nullptr);
    EXPECT_EQ(object->id.view(), "sun");
    EXPECT_EQ(object->pos.Y, 20.0f);
    EXPECT_EQ(object->contour[2].X, 8.0f);
    EXPECT_EQ(object->color.Green, 128);
    EXPECT_EQ(object->user_flags, 7u);
    EXPECT_EQ(object->visible, 1);
    EXPECT_EQ(static_cast<const ImageExtension*>(object->Extension())->image.view(), "tex_sun");
    ASSERT_EQ(object->keypointsnum, 2);
    EXPECT_EQ(object->KeyStates()[1].t, 500);
    EXPECT_EQ(object->KeyStates()[1].pos.X, 50.0f);
    EXPECT_EQ(object->KeyStates()[1].itpl, 1);
    EXPECT_EQ(object->SoundPoints()[0].id.view(), "chime");
    EXPECT_EQ(NextObject(object), nullptr);
    EXPECT_EQ(loader.FindClip("dusk"), nullptr);
}

TEST(ClipsLoader, XmlBuildsTheSameBytesAsTheHandWrittenDump)
{
    ClipRecords clips;
    ASSERT_TRUE(ConvertClipsXml(kDawnXml, strlen(kDawnXml), "clips.xml", clips));
    ASSERT_EQ(clips.size(), 2u);
    EXPECT_EQ(clips["empty"].size() * 4, 120u) << "header and end mark";
    const Bytes hand = OneClipDump(ImageObject());
    const auto& dawn = clips["dawn"];
    const auto* converted = reinterpret_cast<const uint8_t*>(dawn.data());
    ASSERT_EQ(dawn.size() * 4, hand.data.size() - 108);
    EXPECT_EQ(memcmp(converted, hand.data.data() + 108, hand.data.size() - 108), 0);

    // The whole bulk: table sorted by id, records behind it at 4-byte offsets.
    const std::vector<uint32_t> bulk = BuildClipsBulk(clips);
    CClipsLoader loader;
    ASSERT_TRUE(loader.LoadFromMemory(bulk.data(), bulk.size() * 4, "built"));
    ASSERT_EQ(loader.Count(), 2u);
    EXPECT_EQ(loader.Table()[0].id.view(), "dawn");
    EXPECT_EQ(loader.Table()[0].offset, 8u + 2 * 100);
    EXPECT_EQ(loader.Table()[1].offset, 8u + 2 * 100 + dawn.size() * 4);
    ASSERT_NE(loader.FindClip("empty"), nullptr);
    EXPECT_EQ(ObjectsBegin(loader.FindClip("empty")), nullptr);
}

TEST(ClipsLoader, DumpWrittenFromXmlLoadsLikeTheXml)
{
    oxtest::TempDir xmlGame, dumpGame;
    xmlGame.Write("properties/clips.xml", kDawnXml);
    CGamePack xmlPack = FolderPack(xmlGame);
    CClipsLoader fromXml(&xmlPack);
    ASSERT_TRUE(fromXml.Load());
    ASSERT_TRUE(fromXml.IsBuiltFromXml());
    {
        oxtest::ScopedCwd cwd(dumpGame.Path());
        std::filesystem::create_directories(dumpGame / "properties");
        ASSERT_TRUE(fromXml.SaveBindump());
    }
    CGamePack dumpPack = FolderPack(dumpGame);
    CClipsLoader fromDump(&dumpPack);
    ASSERT_TRUE(fromDump.Load());
    EXPECT_FALSE(fromDump.IsBuiltFromXml());
    EXPECT_FALSE(fromDump.SaveBindump()) << "only a bulk built from XML is written";
    ASSERT_EQ(fromDump.DataSize(), fromXml.DataSize());
    EXPECT_EQ(memcmp(fromDump.Data(), fromXml.Data(), fromXml.DataSize()), 0);
    EXPECT_NE(fromDump.FindClip("dawn"), nullptr);
}

TEST(ClipsLoader, FolderOfClipsWithoutGroupsFileWhenThereIsNoClipsXml)
{
    oxtest::TempDir game;
    game.Write("clips/a.xml", R"(<?xml version="1.0"?><Clip id="a"/>)");
    game.Write("clips/b.XML", R"(<?xml version="1.0"?><Clip id="b"/>)");
    game.Write("clips/Groups.xml", R"(<?xml version="1.0"?><Clip id="group"/>)");
    game.Write("clips/broken.xml", "not xml");
    CGamePack pack = FolderPack(game);
    oxtest::LogCapture log;
    CClipsLoader loader(&pack);
    ASSERT_TRUE(loader.Load());
    EXPECT_NE(loader.FindClip("a"), nullptr);
    EXPECT_NE(loader.FindClip("b"), nullptr);
    EXPECT_EQ(loader.FindClip("group"), nullptr);
    EXPECT_TRUE(log.Contains("[anim][0]: Found 3 clips"));
    EXPECT_TRUE(log.Contains("[anim][0]: Loaded clip: 'clips/a.xml'"));
    EXPECT_TRUE(log.Contains("[anim][3]: Can't load clip: 'clips/broken.xml'"));
    EXPECT_TRUE(log.Contains("[anim][1]: Clips loaded"));
}

TEST(ClipsLoader, DumpOfAnotherFormatShowsTheMessageAndLeavesNoClips)
{
    oxtest::TempDir game;
    const Bytes file = OneClipDump(ImageObject(), 0x02504C43);
    game.Write("properties/clips.bindump", std::string(file.data.begin(), file.data.end()));
    game.Write("properties/clips.xml", kDawnXml);
    CGamePack pack = FolderPack(game);
    oxtest::MessageCapture messages;
    CClipsLoader loader(&pack);
    EXPECT_TRUE(loader.Load());
    ASSERT_EQ(messages.Boxes().size(), 1u);
    EXPECT_EQ(messages.Boxes()[0].text, "'properties/clips.bindump' has wrong format version or is corrupted.\n"
                                        "Supported format: 1, format in bindump: 2");
    EXPECT_EQ(loader.FindClip("dawn"), nullptr) << "no fall back to the XML";
}

TEST(ClipsLoader, BrokenDumpsAreRefusedOrLoseOnlyTheBrokenClip)
{
    oxtest::LogCapture log;
    const Bytes good = OneClipDump(ImageObject());
    CClipsLoader loader;
    // Cut anywhere: never a read past the data, never a broken clip handed out.
    for (size_t size = 0; size < good.data.size(); size += 7) {
        const std::vector<uint32_t> words = good.Words();
        loader.LoadFromMemory(words.data(), size, "cut");
        EXPECT_EQ(loader.FindClip("dawn"), nullptr) << size;
    }
    // An object whose size runs past its clip: the clip is left out with its name.
    Bytes object = ImageObject();
    const uint32_t tooBig = 4000;
    memcpy(object.data.data(), &tooBig, 4);
    Bytes file = OneClipDump(object);
    std::vector<uint32_t> words = file.Words();
    EXPECT_TRUE(loader.LoadFromMemory(words.data(), file.data.size(), "big"));
    EXPECT_EQ(loader.FindClip("dawn"), nullptr);
    EXPECT_TRUE(log.Contains("big: clip 'dawn' is left out: an object's size runs past the clip (object 'sun')"));
    // More key states than the object's size holds.
    object = ImageObject();
    object.data[271] = 9;
    file = OneClipDump(object);
    words = file.Words();
    loader.LoadFromMemory(words.data(), file.data.size(), "keys");
    EXPECT_EQ(loader.FindClip("dawn"), nullptr);
    // A table that runs past the file is refused whole.
    file = OneClipDump(ImageObject());
    file.data[4] = 200;
    words = file.Words();
    EXPECT_FALSE(loader.LoadFromMemory(words.data(), file.data.size(), "table"));
    EXPECT_TRUE(log.Contains("Clips bindump 'table' is refused: its table runs past its size"));
}

TEST(ClipsLoader, XmlThatCannotBeUsedIsLoggedWithTheClipAndLeftOut)
{
    std::string xml = R"(<?xml version="1.0"?><clips>
      <Clip id="c"><sprite id="s"/><image id="i" vis="true"><kp t="0"/><bogus/></image>
        <text id="t" tx="0123456789012345678901234567890123456789012345678901234567890"/></Clip>
      <Clip w="5"/>
      <Clip id="many"><image id="m">)";
    for (int i = 0; i < 256; ++i)
        xml += "<kp t=\"" + std::to_string(i) + "\"/>";
    xml += "</image></Clip></clips>";
    oxtest::LogCapture log;
    ClipRecords clips;
    ASSERT_TRUE(ConvertClipsXml(xml.data(), xml.size(), "bad.xml", clips));
    ASSERT_EQ(clips.size(), 2u);
    const auto* c = reinterpret_cast<const ClipRecord*>(clips["c"].data());
    const ClipObjectBase* image = ObjectsBegin(c);
    ASSERT_NE(image, nullptr);
    EXPECT_EQ(image->id.view(), "i");
    EXPECT_EQ(NextObject(image), nullptr) << "the text with a key too long is left out";
    EXPECT_TRUE(log.Contains("bad.xml: clip 'c': unknown object kind 'sprite' is left out"));
    EXPECT_TRUE(log.Contains("bad.xml: clip 'c': the text key '0123"));
    EXPECT_TRUE(log.Contains("bad.xml: a clip without a usable id is left out"));
    EXPECT_TRUE(log.Contains("bad.xml: clip 'many': object 'm' has more than 255 key states; 1 are left out"));
    const auto* many = reinterpret_cast<const ClipRecord*>(clips["many"].data());
    EXPECT_EQ(ObjectsBegin(many)->keypointsnum, 255);
    // An object closed by "</>" (no end callback) is dropped when its clip ends; nothing of
    // it reaches a later element.
    const std::string anonymous = R"(<?xml version="1.0"?><clips><Clip id="a"><image id="i" vis="true"><kp t="0"/>
        </></Clip><x><y></y></x><Clip id="b"/></clips>)";
    ClipRecords closed;
    ASSERT_TRUE(ConvertClipsXml(anonymous.data(), anonymous.size(), "anonymous.xml", closed));
    ASSERT_EQ(closed.size(), 2u);
    EXPECT_EQ(ObjectsBegin(reinterpret_cast<const ClipRecord*>(closed["a"].data())), nullptr);
    // A document that breaks off adds nothing.
    const std::string cut = xml.substr(0, 120);
    ClipRecords none;
    EXPECT_FALSE(ConvertClipsXml(cut.data(), cut.size(), "cut.xml", none));
    EXPECT_TRUE(none.empty());
}

// The table of records: ordering with ties, improved scores of one play-through, the last
// position, records.xml as written and read, short and hand-edited tables.
#include "game/Profile.h"
#include "game/RecordTable.h"
#include "misc/Unicode.h"
#include "support/TestSupport.h"

using namespace k17;

namespace {

const std::string kHead = "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n";

struct Records : ::testing::Test {
    oxtest::TempDir dir;
    oxtest::LogCapture log;
    CRecordTable table;

    void SetUp() override
    {
        table.SetDefaultName(u"Nobody");
        table.SetFolder(ox::misc::Utf8ToWide(dir.Path().string()));
        table.Load();
    }
    static CProfile Player(const char16_t* name, const char* game)
    {
        CProfile profile(name, nullptr);
        profile.SetGameGUID(game);
        return profile;
    }
    std::string Scores() const
    {
        std::string text;
        for (const RecordInfo& r : table.Records())
            text += ox::misc::WideToUtf8(r.Name).substr(0, 1) + std::to_string(r.Score) + " ";
        return text;
    }
};

} // namespace

TEST_F(Records, FirstLoadGivesTenDefaultsThatAZeroCannotEnter)
{
    EXPECT_EQ(Scores(), "N0 N0 N0 N0 N0 N0 N0 N0 N0 N0 ");
    EXPECT_EQ(table.GetLastRecordPos(), -1);
    EXPECT_EQ(table.AddRecord(Player(u"Ann", "g1"), 0), -1);
}

TEST_F(Records, OrderingTiesAndImprovedScores)
{
    EXPECT_EQ(table.AddRecord(Player(u"Ann", "a"), 50), 1);
    EXPECT_EQ(table.AddRecord(Player(u"Bob", "b"), 50), 2) << "behind equal scores";
    EXPECT_EQ(table.AddRecord(Player(u"Cy", "c"), 70), 1);
    EXPECT_EQ(table.AddRecord(Player(u"Bob", "b"), 80), 1) << "an improved score moves its entry up";
    EXPECT_EQ(table.GetLastRecordPos(), 1);
    EXPECT_EQ(Scores(), "B80 C70 A50 N0 N0 N0 N0 N0 N0 N0 ");
    EXPECT_EQ(table.AddRecord(Player(u"Bob", "b"), 60), 3) << "a lower score of the same game is a new entry";
    EXPECT_EQ(Scores(), "B80 C70 B60 A50 N0 N0 N0 N0 N0 N0 ");
    // An empty game GUID matches the default entries: the first one not above it is replaced.
    EXPECT_EQ(table.AddRecord(Player(u"Eve", ""), 5), 5);
    EXPECT_EQ(Scores(), "B80 C70 B60 A50 E5 N0 N0 N0 N0 N0 ");
    for (int i = 0; i < 5; ++i)
        table.AddRecord(Player(u"Fay", ("f" + std::to_string(i)).c_str()), 10);
    EXPECT_EQ(Scores(), "B80 C70 B60 A50 F10 F10 F10 F10 F10 E5 ");
    EXPECT_EQ(table.AddRecord(Player(u"Gus", "g"), 5), -1) << "equal to the lowest of a full table";
    EXPECT_EQ(table.AddRecord(Player(u"Gus", "g"), 10), 10) << "the last place";
    EXPECT_EQ(Scores(), "B80 C70 B60 A50 F10 F10 F10 F10 F10 G10 ");
}

TEST_F(Records, FileKeepsOrderAndShortTablesTakeNothingBelowTheirEnd)
{
    table.AddRecord(Player(u"Ann", "a"), 50);
    ASSERT_TRUE(table.Save());
    const std::string start = kHead + "<Records last_record_num=\"1\" >\n"
                                      "<record name=\"Ann\" score=\"50\" game_guid=\"a\" />\n"
                                      "<record name=\"Nobody\" score=\"0\" game_guid=\"\" />\n";
    EXPECT_EQ(oxtest::ReadFile(dir / "records.xml").substr(0, start.size()), start);

    dir.Write("records.xml", kHead + "<Records last_record_num=\"2\"><record name=\"Low\" score=\"3\" game_guid=\"x\"/>"
                             "<record name=\"High\" score=\"9\" game_guid=\"y\"/>"
                             "<record name=\"Bad\" score=\"lots\" game_guid=\"z\" extra=\"1\"/></Records>");
    table.Load();
    EXPECT_EQ(Scores(), "L3 H9 B0 ") << "the stored order, unsorted; a bad score reads as 0";
    EXPECT_EQ(table.GetLastRecordPos(), 2);
    EXPECT_EQ(table.AddRecord(Player(u"Ann", "a"), -1), -1);
    EXPECT_EQ(table.AddRecord(Player(u"Ann", "a"), 4), 1);
    EXPECT_TRUE(log.Contains("records.xml: <record> attribute score=\"lots\" is not a number"));
    EXPECT_TRUE(log.Contains("records.xml: <record> has an unknown attribute extra, ignored"));

    dir.Write("records.xml", kHead + "<Records last_record_num=\"99\"><record name=\"A\" score=\"1\"/></Records>");
    table.Load();
    EXPECT_EQ(table.GetLastRecordPos(), -1);

    dir.Write("records.xml", kHead + "<Records last_record_num=\"4\"/>");
    table.Load();
    EXPECT_EQ(table.Records().size(), 10u);
    EXPECT_EQ(table.GetLastRecordPos(), -1);
}

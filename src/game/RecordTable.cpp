#include "game/RecordTable.h"

#include "core/Application.h"
#include "core/SettingsReaders.h"
#include "game/PlayerFiles.h"
#include "game/Profile.h"
#include "misc/XmlWriter.h"
#include "misc/sys/Path.h"

#include <iterator>

namespace k17 {

using namespace ox;

namespace {

constexpr const char16_t* kRecordsFile = u"records.xml";

bool ByScoreDescending(const RecordInfo& a, const RecordInfo& b) { return a.Score > b.Score; }

} // namespace

CRecordTable::CRecordTable()
{
    const core::CSettingsGroup& constants =
        core::g_Application ? core::g_Application->GetSettings().GetChild("Constants") : core::CSettingsGroup::Empty();
    SetDefaultName(core::ReadWString(constants.GetChild("records_window"), "def_player_name"));
}

void CRecordTable::Clear()
{
    m_Records.assign(TableSize, RecordInfo{m_DefaultName, 0, std::string()});
    m_LastRecordPos = -1;
}

int CRecordTable::AddRecord(const CProfile& profile, int score)
{
    const std::string& guid = profile.GetGameGUID();
    for (RecordInfo& record : m_Records) {
        if (record.GameGUID != guid || record.Score > score)
            continue;
        record.Score = score;
        record.Name = profile.GetName();
        m_Records.sort(ByScoreDescending);
        int place = 1;
        for (auto it = m_Records.begin(); it->GameGUID != guid; ++it)
            ++place;
        return m_LastRecordPos = place;
    }
    // Behind every entry of an equal or better score.
    auto at = m_Records.begin();
    while (at != m_Records.end() && at->Score >= score)
        ++at;
    if (at == m_Records.end())
        return -1;
    m_LastRecordPos = static_cast<int>(std::distance(m_Records.begin(), at)) + 1;
    m_Records.insert(at, RecordInfo{profile.GetName(), score, guid});
    if (m_Records.size() > TableSize)
        m_Records.resize(TableSize);
    return m_LastRecordPos;
}

bool CRecordTable::Save() const
{
    misc::CXmlWriter writer(true);
    {
        misc::CXmlElement root(writer, "Records");
        root.Attr("last_record_num", misc::ToXmlValue(m_LastRecordPos));
        for (const RecordInfo& record : m_Records) {
            misc::CXmlElement node(root, "record");
            node.Attr("name", record.Name);
            node.Attr("score", misc::ToXmlValue(record.Score));
            node.Attr("game_guid", misc::EscapeXml(record.GameGUID).c_str());
        }
    }
    return WritePlayerFile(writer, GetRecordsFile());
}

void CRecordTable::SetFolder(const wstring& folder)
{
    m_Folder = folder;
    MakeSavesFolder(folder);
}

wstring CRecordTable::GetRecordsFile() const { return misc::sys::AppendPath(m_Folder, kRecordsFile); }

void CRecordTable::Load()
{
    const wstring file = GetRecordsFile();
    core::CSettings settings;
    m_Records.clear();
    if (ReadPlayerFile(settings, file, "Records")) {
        const CAttributeReader reader(file);
        const core::CSettingsGroup& root = settings.GetChild("Records");
        reader.WarnUnknown(root, {"last_record_num"});
        if (reader.Read(root, "last_record_num", m_LastRecordPos) &&
            (m_LastRecordPos < -1 || m_LastRecordPos == 0 || m_LastRecordPos > static_cast<int>(TableSize))) {
            reader.Problem("last_record_num is no place of the table: none is marked");
            m_LastRecordPos = -1;
        }
        for (const core::SettingsGroupPtrT& node : root.GetChildren()) {
            if (node->GetId() != "record")
                continue;
            if (m_Records.size() == TableSize) {
                reader.Problem("more than ten records: the rest are left out");
                break;
            }
            reader.WarnUnknown(*node, {"name", "score", "game_guid"});
            RecordInfo record{m_DefaultName, 0, std::string()};
            reader.Read(*node, "name", record.Name);
            reader.Read(*node, "score", record.Score);
            reader.Read(*node, "game_guid", record.GameGUID);
            m_Records.push_back(record);
        }
    }
    if (m_Records.empty())
        Clear();
}

CRecordTable& g_RecordTable::Instance()
{
    static auto* table = new CRecordTable();
    return *table;
}

} // namespace k17

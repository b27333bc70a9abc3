#pragma once
// The table of records: ten entries, the best first, kept in records.xml in the saves folder.
// Each entry remembers the game GUID of its play-through; a score at least as good as that
// entry's replaces it in place.
#include "misc/GenericIterator.h"
#include "misc/WideChar.h"

#include <list>
#include <string>

namespace k17 {

class CProfile;

struct RecordInfo {
    ox::wstring Name;
    int Score = 0;
    std::string GameGUID;
};

class CRecordTable {
public:
    using RecordsT = std::list<RecordInfo>;
    using RecordsIteratorT = ox::misc::CGenericIterator<RecordsT>;
    static constexpr size_t TableSize = 10;

    // The default name from Constants/records_window@def_player_name, else "Player"; the
    // table starts empty until Load or Clear.
    CRecordTable();
    CRecordTable(const CRecordTable&) = delete;
    CRecordTable& operator=(const CRecordTable&) = delete;

    void SetDefaultName(const ox::wstring& name) { m_DefaultName = name.empty() ? u"Player" : name; }

    // The 1-based place the score takes (or keeps, for an improved score of the same
    // play-through), or -1 when it does not make the table.
    int AddRecord(const CProfile& profile, int score);
    // Ten entries of the default name with score 0.
    void Clear();
    int GetLastRecordPos() const { return m_LastRecordPos; }
    RecordsIteratorT GetRecords() { return RecordsIteratorT(&m_Records); }
    const RecordsT& Records() const { return m_Records; }
    // Writes records.xml; false when it cannot be written.
    bool Save() const;

    // Creates the folder if it does not exist.
    void SetFolder(const ox::wstring& folder);
    // Reads records.xml from the disk, keeping its order; no file or no entries: Clear.
    void Load();
    ox::wstring GetRecordsFile() const;

private:
    int m_LastRecordPos = -1;
    RecordsT m_Records;
    ox::wstring m_Folder;
    ox::wstring m_DefaultName;
};

struct g_RecordTable {
    static CRecordTable& Instance();
};

} // namespace k17

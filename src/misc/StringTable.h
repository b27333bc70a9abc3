#pragma once
// The table of numbered player texts, and the expansion of "$<id>" references.
#include "misc/WideChar.h"

#include <cstdint>
#include <string>
#include <utility>
#include <vector>

namespace ox::misc {

class CStringTable {
public:
    CStringTable() = default;
    ~CStringTable();
    CStringTable(const CStringTable&) = delete;
    CStringTable& operator=(const CStringTable&) = delete;

    // The process-wide table (g_StringTable in scripts), created at first use.
    static CStringTable& Instance();

    // properties/strings.bindump, else properties/strings.xml.bin_utf16le, else
    // properties/strings.xml, all through the game pack.
    void Load();
    void Load(class CGamePack& pack);

    const wchar* GetString(int id) const;
    wstring FormatByStringsID(const wstring& text) const;
    wstring FormatByStringsID(const std::string& text) const;
    wstring FormatByStringsID(const char* text) const;

    // Writes the table to strings.xml.bin_utf16le and strings.xml.bin_utf32le in the
    // working folder. False without a table.
    bool SaveBinaryDumps() const;

    bool HasTable() const { return m_Table != nullptr; }
    uint32_t GetCount() const;

    // Uses a 16-bit table in place (not owned) after checking its magic and structure.
    bool UseTable(const uint8_t* data, size_t size, const char* name);
    // Builds an owned "S16L" table from texts (sorted by id here; duplicates stay).
    void BuildFromTexts(std::vector<std::pair<int, wstring>> texts);

    // The binary forms, for the content tools.
    static std::vector<uint8_t> BuildBinary16(std::vector<std::pair<int, wstring>> texts, const char magic[4]);
    std::vector<uint8_t> BuildBinary32() const;
    // Parses strings.xml text into (id, text) pairs; false if the XML is malformed.
    static bool ParseXml(const char* data, size_t size, const std::string& name,
                         std::vector<std::pair<int, wstring>>& texts);

private:
    void Release();
    int SearchIndex(int id) const;

    const uint8_t* m_Table = nullptr;
    size_t m_Size = 0;
    bool m_Owned = false;
    const void* m_PackHandle = nullptr; // what the game pack gave, to close it
    class CGamePack* m_Pack = nullptr;
};

// A text with its "$" references, and its expansion kept up to date.
class CLocalString {
public:
    CLocalString() = default;
    explicit CLocalString(const wstring& key) { *this = key; }
    CLocalString& operator=(const wstring& key);
    const wchar* c_str() const { return m_Text.c_str(); }
    const wstring& GetKey() const { return m_Key; }
    const wstring& GetText() const { return m_Text; }
    bool operator==(const CLocalString& other) const { return m_Text == other.m_Text; }
    bool operator==(const wstring& text) const;

private:
    wstring m_Key;
    wstring m_Text;
};

} // namespace ox::misc

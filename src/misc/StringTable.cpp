#include "misc/StringTable.h"

#include "diag/Assert.h"
#include "diag/Log.h"
#include "diag/Message.h"
#include "misc/ChunkBuffer.h"
#include "misc/GamePack.h"
#include "misc/Unicode.h"
#include "misc/XmlParser.h"
#include "misc/sys/Path.h"

#include <algorithm>
#include <cstdio>
#include <cstring>
#include <strings.h>

namespace ox::misc {

namespace {

constexpr char kMagicBindump[4] = {'S', '1', '6', 0x01};
constexpr char kMagic16[4] = {'S', '1', '6', 'L'};
constexpr char kMagic32[4] = {'S', '3', '2', 'L'};
constexpr size_t kMissBufferSize = 255;

uint32_t ReadU32(const uint8_t* p)
{
    uint32_t v;
    memcpy(&v, p, 4);
    return v;
}

void WriteU32(std::vector<uint8_t>& out, size_t at, uint32_t v) { memcpy(out.data() + at, &v, 4); }

} // namespace

CStringTable::~CStringTable() { Release(); }

void CStringTable::Load() { Load(g_GamePack::Instance()); }

void CStringTable::Load(CGamePack& pack)
{
    Release();
    for (const char* path : {"properties/strings.bindump", "properties/strings.xml.bin_utf16le"}) {
        unsigned size = 0;
        const void* data = pack.Open(path, &size);
        if (!data)
            continue;
        if (UseTable(static_cast<const uint8_t*>(data), size, path)) {
            m_PackHandle = data;
            m_Pack = &pack;
            return;
        }
        diag::message::Show("Error", "strings.bindump is corrupted or contains wrong encoding.");
        pack.Close(data);
        break;
    }
    unsigned size = 0;
    const void* xml = pack.Open("properties/strings.xml", &size);
    if (!xml) {
        OX_LOG("StringTable", diag::LogError, "Failed to load StringTable data");
        return;
    }
    std::vector<std::pair<int, wstring>> texts;
    ParseXml(static_cast<const char*>(xml), size, "properties/strings.xml", texts);
    pack.Close(xml);
    BuildFromTexts(std::move(texts));
}

namespace {

struct XmlLoad {
    int currentId = -1;
    ChunkBuffer chunks;
    std::vector<std::pair<int, const wchar*>> entries;
};

void OnStringAttribute(void* user, XmlRecord*, int, const char* name, size_t nameLength, const char* value,
                       size_t valueLength, bool)
{
    if (nameLength != 2 || strncasecmp(name, "id", 2) != 0)
        return;
    StringA88 id(std::string_view(value, std::min<size_t>(valueLength, 87)));
    static_cast<XmlLoad*>(user)->currentId = atoi(id.c_str());
}

void OnStringText(void* user, XmlRecord* stack, int depth, bool)
{
    auto* load = static_cast<XmlLoad*>(user);
    if (load->currentId == -1)
        return;
    const XmlRecord& record = stack[depth];
    wstring text = Utf8ToWide(std::string_view(record.text, record.textLength));
    size_t bytes = (text.size() + 1) * sizeof(wchar);
    auto* copy = static_cast<wchar*>(load->chunks.Allocate(32768, bytes));
    OX_CHECK_DATA(copy);
    memcpy(copy, text.c_str(), bytes);
    load->entries.emplace_back(load->currentId, copy);
    load->currentId = -1;
}

} // namespace

bool CStringTable::ParseXml(const char* data, size_t size, const std::string& name,
                            std::vector<std::pair<int, wstring>>& texts)
{
    XmlLoad load;
    XmlParseProblem problem;
    bool ok = misc::ParseXml(data, size, &load, nullptr, OnStringAttribute, nullptr, nullptr, OnStringText, &problem);
    if (!ok || !problem.what.empty())
        OX_LOG("StringTable", diag::LogError, "%s line %u: %s", name.c_str(), problem.line,
               problem.what.empty() ? "not an XML file" : problem.what.c_str());
    for (const auto& [id, text] : load.entries)
        texts.emplace_back(id, text);
    return ok && problem.what.empty();
}

CStringTable& CStringTable::Instance()
{
    static CStringTable* instance = new CStringTable();
    return *instance;
}

void CStringTable::Release()
{
    if (m_Owned)
        delete[] m_Table;
    if (m_PackHandle)
        m_Pack->Close(m_PackHandle);
    m_PackHandle = nullptr;
    m_Pack = nullptr;
    m_Table = nullptr;
    m_Size = 0;
    m_Owned = false;
}

uint32_t CStringTable::GetCount() const { return m_Table ? ReadU32(m_Table + 4) : 0; }

bool CStringTable::UseTable(const uint8_t* data, size_t size, const char* name)
{
    bool magicOk = size >= 8 && (memcmp(data, kMagicBindump, 4) == 0 || memcmp(data, kMagic16, 4) == 0);
    if (magicOk) {
        // Every index entry and every string must lie inside the data, terminator included.
        uint32_t count = ReadU32(data + 4);
        if (count > (size - 8) / 8) {
            OX_LOG("StringTable", diag::LogError, "%s: %u entries do not fit in %zu bytes", name, count, size);
            magicOk = false;
        }
        for (uint32_t i = 0; magicOk && i < count; ++i) {
            uint32_t offset = ReadU32(data + 8 + 8 * i + 4);
            bool terminated = false;
            if (offset >= 8 + 8ull * count && offset % 2 == 0) {
                for (size_t at = offset; at + 1 < size; at += 2)
                    if (data[at] == 0 && data[at + 1] == 0) {
                        terminated = true;
                        break;
                    }
            }
            if (!terminated) {
                OX_LOG("StringTable", diag::LogError, "%s: entry %u points outside the table", name, i);
                magicOk = false;
            }
        }
    }
    if (!magicOk)
        return false;
    Release();
    m_Table = data;
    m_Size = size;
    m_Owned = false;
    return true;
}

std::vector<uint8_t> CStringTable::BuildBinary16(std::vector<std::pair<int, wstring>> texts, const char magic[4])
{
    std::stable_sort(texts.begin(), texts.end(), [](const auto& a, const auto& b) { return a.first < b.first; });
    size_t total = 8 + 8 * texts.size();
    for (const auto& t : texts)
        total += (t.second.size() + 1) * 2;
    std::vector<uint8_t> out(total, 0);
    memcpy(out.data(), magic, 4);
    WriteU32(out, 4, static_cast<uint32_t>(texts.size()));
    size_t at = 8 + 8 * texts.size();
    for (size_t i = 0; i < texts.size(); ++i) {
        WriteU32(out, 8 + 8 * i, static_cast<uint32_t>(texts[i].first));
        WriteU32(out, 8 + 8 * i + 4, static_cast<uint32_t>(at));
        for (wchar c : texts[i].second) {
            out[at++] = static_cast<uint8_t>(c & 0xFF);
            out[at++] = static_cast<uint8_t>(c >> 8);
        }
        at += 2; // terminator
    }
    return out;
}

void CStringTable::BuildFromTexts(std::vector<std::pair<int, wstring>> texts)
{
    std::vector<uint8_t> table = BuildBinary16(std::move(texts), kMagic16);
    Release();
    auto* owned = new uint8_t[table.size()];
    memcpy(owned, table.data(), table.size());
    m_Table = owned;
    m_Size = table.size();
    m_Owned = true;
}

int CStringTable::SearchIndex(int id) const
{
    if (!m_Table)
        return -1;
    int lo = 0;
    int hi = static_cast<int>(GetCount()) - 1;
    while (lo <= hi) {
        int mid = (lo + hi) / 2;
        int midId = static_cast<int>(ReadU32(m_Table + 8 + 8 * mid));
        if (midId == id)
            return mid;
        if (midId > id)
            hi = mid - 1;
        else
            lo = mid + 1;
    }
    return -1;
}

const wchar* CStringTable::GetString(int id) const
{
    int index = SearchIndex(id);
    if (index < 0) {
        static wchar missing[kMissBufferSize];
        StringFormat(missing, kMissBufferSize, u"String \"$%i\" has not found!", id);
        return missing;
    }
    return reinterpret_cast<const wchar*>(m_Table + ReadU32(m_Table + 8 + 8 * index + 4));
}

wstring CStringTable::FormatByStringsID(const wstring& text) const
{
    wstring out;
    out.reserve(text.size());
    bool inside = false;
    uint32_t id = 0; // wraps like plain 32-bit arithmetic
    for (size_t i = 0; i <= text.size(); ++i) {
        bool end = i == text.size();
        wchar c = end ? 0 : text[i];
        if (inside) {
            if (!end && c >= u'0' && c <= u'9') {
                id = id * 10 + static_cast<uint32_t>(c - u'0');
                continue;
            }
            out += GetString(static_cast<int>(id));
            inside = false;
        }
        if (end)
            break;
        if (c == u'$') {
            if (i + 1 < text.size() && text[i + 1] == u'$') {
                out.push_back(u'$');
                ++i;
            } else {
                inside = true;
                id = 0;
            }
        } else {
            out.push_back(c);
        }
    }
    return out;
}

wstring CStringTable::FormatByStringsID(const std::string& text) const
{
    return FormatByStringsID(ConvertToWide(text));
}

wstring CStringTable::FormatByStringsID(const char* text) const
{
    return text ? FormatByStringsID(std::string(text)) : wstring();
}

std::vector<uint8_t> CStringTable::BuildBinary32() const
{
    uint32_t count = GetCount();
    std::vector<std::pair<uint32_t, wstring>> entries;
    for (uint32_t i = 0; i < count; ++i) {
        uint32_t id = ReadU32(m_Table + 8 + 8 * i);
        entries.emplace_back(id, reinterpret_cast<const wchar*>(m_Table + ReadU32(m_Table + 8 + 8 * i + 4)));
    }
    size_t total = 8 + 8 * entries.size();
    for (const auto& e : entries)
        total += (e.second.size() + 1) * 4;
    std::vector<uint8_t> out(total, 0);
    memcpy(out.data(), kMagic32, 4);
    WriteU32(out, 4, count);
    size_t at = 8 + 8 * entries.size();
    for (size_t i = 0; i < entries.size(); ++i) {
        WriteU32(out, 8 + 8 * i, entries[i].first);
        WriteU32(out, 8 + 8 * i + 4, static_cast<uint32_t>(at));
        for (wchar c : entries[i].second) {
            WriteU32(out, at, c);
            at += 4;
        }
        at += 4;
    }
    return out;
}

bool CStringTable::SaveBinaryDumps() const
{
    if (!m_Table)
        return false;
    // A file that cannot be written is passed over.
    sys::WriteFileAtomically("strings.xml.bin_utf16le", m_Table, m_Size);
    std::vector<uint8_t> wide = BuildBinary32();
    sys::WriteFileAtomically("strings.xml.bin_utf32le", wide.data(), wide.size());
    return true;
}

CLocalString& CLocalString::operator=(const wstring& key)
{
    m_Key = key;
    m_Text = CStringTable::Instance().FormatByStringsID(key);
    return *this;
}

bool CLocalString::operator==(const wstring& text) const
{
    return m_Text == CStringTable::Instance().FormatByStringsID(text);
}

} // namespace ox::misc

#pragma once
// The player's files in the saves folder (profiles, options, records): read straight from the
// disk with a log line naming a missing or damaged file, typed attribute reads that log a bad
// value and keep the default, and writes through a temporary file that replace the old file
// only once the new one is whole on disk.
#include "core/Settings.h"
#include "misc/WideChar.h"

#include <initializer_list>
#include <string>

namespace ox::misc {
class CXmlWriter;
}

namespace k17 {

// Reads the file at `path` on disk into `settings`. A missing file is logged as such and
// gives false. A damaged one is logged, naming it, and copied beside itself as
// "<file>.broken", so that the next save cannot destroy what a person could still recover;
// what could be read stays in `settings`, and the result says whether the root element
// `root` was read.
bool ReadPlayerFile(ox::core::CSettings& settings, const ox::wstring& path, const char* root);

// Attribute reads for one player's file: `value` changes only when the attribute exists and
// holds a value of its type. A bad value is logged with the file and the attribute, and the
// default stays. True when the value was taken.
class CAttributeReader {
public:
    explicit CAttributeReader(const ox::wstring& file) : m_File(file) {}

    bool Read(const ox::core::CSettingsGroup& group, const char* name, int& value) const;
    bool Read(const ox::core::CSettingsGroup& group, const char* name, float& value) const;
    bool Read(const ox::core::CSettingsGroup& group, const char* name, bool& value) const;
    bool Read(const ox::core::CSettingsGroup& group, const char* name, std::string& value) const;
    bool Read(const ox::core::CSettingsGroup& group, const char* name, ox::wstring& value) const;
    // A float that must lie in [low, high]: a value outside is logged and clamped.
    bool Read(const ox::core::CSettingsGroup& group, const char* name, float& value, float low, float high) const;

    // Logs each attribute of `group` whose name is not among `known`; it is ignored.
    void WarnUnknown(const ox::core::CSettingsGroup& group, std::initializer_list<const char*> known) const;

    // Logs a problem of the file's content on channel "data", naming the file.
    void Problem(const char* what) const;

private:
    ox::wstring m_File;
};

// Writes the writer's text to `path` through a temporary file beside it, flushed to disk and
// renamed over the old file, then gives its user full access. A failure is logged, the old
// file stays as it was, and the first failure of the run is shown to the player.
bool WritePlayerFile(const ox::misc::CXmlWriter& writer, const ox::wstring& path);

// Creates the folder if it is missing; a folder that cannot be made is logged.
bool MakeSavesFolder(const ox::wstring& folder);

} // namespace k17

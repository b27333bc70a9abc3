#include "game/PlayerFiles.h"

#include "core/SettingsReaders.h"
#include "diag/Log.h"
#include "diag/Message.h"
#include "misc/Unicode.h"
#include "misc/XmlParser.h"
#include "misc/XmlWriter.h"
#include "misc/sys/Path.h"

#include <boost/lexical_cast.hpp>

#include <cmath>
#include <cstdlib>

namespace k17 {

using namespace ox;

namespace {

// Keeps a damaged file's bytes beside it before a save replaces it.
void KeepBrokenCopy(const std::string& native, const std::string& bytes)
{
    if (!misc::sys::WriteFileAtomically(native + ".broken", bytes.data(), bytes.size()))
        OX_LOG("data", diag::LogWarning, "cannot keep a copy of the damaged %s", native.c_str());
}

// Whether the bytes are one whole document: a head, every element closed, nothing noticed on
// the way. The settings reader keeps what it can of a document cut short without a word.
bool IsWholeDocument(const std::string& bytes)
{
    struct Count {
        int open = 0;
        int closed = 0;
    } count;
    misc::XmlParseProblem problem;
    bool accepted = misc::ParseXml(
        bytes.data(), bytes.size(), &count,
        [](void* user, misc::XmlRecord*, int) { ++static_cast<Count*>(user)->open; }, nullptr,
        nullptr, [](void* user, misc::XmlRecord*, int) { ++static_cast<Count*>(user)->closed; }, nullptr, &problem);
    return accepted && problem.what.empty() && count.open > 0 && count.open == count.closed;
}

// Whether a saving problem has been shown to the player in this run.
bool g_SaveProblemShown = false;

} // namespace

bool ReadPlayerFile(core::CSettings& settings, const wstring& path, const char* root)
{
    const std::string native = misc::sys::NativePath(path);
    std::string bytes;
    if (!misc::sys::CheckExistPath(path)) {
        OX_LOG("app", diag::LogInfo, "%s does not exist yet: the defaults stay", native.c_str());
        return false;
    }
    if (!misc::sys::ReadWholeFile(native, bytes)) {
        OX_LOG("data", diag::LogError, "%s cannot be read: the defaults stay", native.c_str());
        return false;
    }
    bool parsed = settings.LoadXmlFromMemory(bytes.data(), bytes.size(), native) && IsWholeDocument(bytes);
    bool hasRoot = settings.GetChildRef(root) != nullptr;
    if (!parsed || !hasRoot) {
        OX_LOG("data", diag::LogError, "%s is damaged (%s): what could be read is used, a copy is kept as %s.broken",
               native.c_str(), bytes.empty() ? "empty" : (hasRoot ? "cut short or malformed" : "no root element"),
               native.c_str());
        KeepBrokenCopy(native, bytes);
    }
    return hasRoot;
}

void CAttributeReader::WarnUnknown(const core::CSettingsGroup& group, std::initializer_list<const char*> known) const
{
    for (unsigned i = 0; i < group.EnumAttributes(); ++i) {
        const std::string name = group.GetAttribute(i).c_str();
        bool listed = false;
        for (const char* k : known)
            listed = listed || name == k;
        if (!listed)
            Problem(("<" + std::string(group.GetId().c_str()) + "> has an unknown attribute " + name + ", ignored").c_str());
    }
}

void CAttributeReader::Problem(const char* what) const
{
    OX_LOG("data", diag::LogWarning, "%s: %s", misc::WideToUtf8(m_File).c_str(), what);
}

namespace {

template <class T>
bool ReadNumber(const CAttributeReader& reader, const core::CSettingsGroup& group, const char* name, T& value)
{
    if (!group.IsValue(name))
        return false;
    const std::string& text = group.GetValue(name);
    try {
        T read = boost::lexical_cast<T>(text);
        if constexpr (std::is_floating_point_v<T>) {
            if (!std::isfinite(read))
                throw boost::bad_lexical_cast();
        }
        value = read;
        return true;
    } catch (const boost::bad_lexical_cast&) {
        std::string what = "<" + std::string(group.GetId().c_str()) + "> attribute " + name + "=\"" + text +
                           "\" is not a number; the default stays";
        reader.Problem(what.c_str());
        return false;
    }
}

} // namespace

bool CAttributeReader::Read(const core::CSettingsGroup& group, const char* name, int& value) const
{
    return ReadNumber(*this, group, name, value);
}

bool CAttributeReader::Read(const core::CSettingsGroup& group, const char* name, float& value) const
{
    return ReadNumber(*this, group, name, value);
}

bool CAttributeReader::Read(const core::CSettingsGroup& group, const char* name, float& value, float low,
                            float high) const
{
    if (!ReadNumber(*this, group, name, value))
        return false;
    if (value < low || value > high) {
        std::string what = "<" + std::string(group.GetId().c_str()) + "> attribute " + name + " is out of range";
        Problem(what.c_str());
        value = value < low ? low : high;
    }
    return true;
}

bool CAttributeReader::Read(const core::CSettingsGroup& group, const char* name, bool& value) const
{
    if (!group.IsValue(name))
        return false;
    const std::string& text = group.GetValue(name);
    if (text != "true" && text != "false") {
        std::string what = "<" + std::string(group.GetId().c_str()) + "> attribute " + name + "=\"" + text +
                           "\" is neither true nor false; the default stays";
        Problem(what.c_str());
        return false;
    }
    value = text == "true";
    return true;
}

bool CAttributeReader::Read(const core::CSettingsGroup& group, const char* name, std::string& value) const
{
    if (!group.IsValue(name))
        return false;
    value = group.GetValue(name);
    return true;
}

bool CAttributeReader::Read(const core::CSettingsGroup& group, const char* name, wstring& value) const
{
    if (!group.IsValue(name))
        return false;
    value = misc::Utf8ToWide(group.GetValue(name));
    return true;
}

bool WritePlayerFile(const misc::CXmlWriter& writer, const wstring& path)
{
    void* data = nullptr;
    unsigned size = 0;
    const std::string native = misc::sys::NativePath(path);
    bool written = writer.GetBuffer(&data, &size) && misc::sys::WriteFileAtomically(native, data, size);
    free(data);
    if (written) {
        misc::sys::SetNamedFullAccess(path, false);
        return true;
    }
    OX_LOG("app", diag::LogError, "cannot save %s: the file on disk stays as it was", native.c_str());
    if (!g_SaveProblemShown) {
        g_SaveProblemShown = true;
        diag::message::ShowFormat("Saving failed",
                                  "The game cannot save into %s. It goes on, but what changes now may not be kept.",
                                  native.c_str());
    }
    return false;
}

bool MakeSavesFolder(const wstring& folder)
{
    if (misc::sys::CheckExistPath(folder))
        return true;
    if (misc::sys::CreateFolder(folder))
        return true;
    OX_LOG("app", diag::LogError, "cannot create the saves folder %s", misc::sys::NativePath(folder).c_str());
    return false;
}

} // namespace k17

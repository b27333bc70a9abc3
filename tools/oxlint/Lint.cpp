#include "oxlint/Lint.h"

#include "misc/GamePack.h"
#include "misc/StringTable.h"
#include "misc/sys/Path.h"
#include "oxlint/LuaScan.h"
#include "quest/ObjectScripts.h"

#include <algorithm>
#include <cctype>
#include <filesystem>

namespace fs = std::filesystem;

namespace oxlint {

namespace {

const char* KindName(Kind kind)
{
    static const char* const names[] = {"texture", "font",   "clip",   "particle system", "sound", "video",
                                        "template", "string", "effect", "window",          "level", "file"};
    return names[static_cast<int>(kind)];
}

bool EndsWith(const std::string& text, const std::string& end)
{
    return text.size() >= end.size() && text.compare(text.size() - end.size(), end.size(), end) == 0;
}

bool IsNumber(const std::string& text)
{
    return !text.empty() && std::all_of(text.begin(), text.end(), [](char c) {
        return isdigit(static_cast<unsigned char>(c)) || c == '.' || c == '-' || c == ' ';
    });
}

// What an attribute of the data names, by its name; false for attributes that name nothing.
bool AttributeKind(const std::string& name, Kind& kind)
{
    static const std::set<std::string> textures = {"image", "image_id", "i_id", "tex_id", "texture", "background",
                                                   "tool_tip_background", "frame", "progress"};
    if (textures.count(name) || EndsWith(name, "_image"))
        kind = Kind::Texture;
    else if (name == "font" || EndsWith(name, "_font"))
        kind = Kind::Font;
    else if (name == "sound" || EndsWith(name, "_sound") || name.rfind("sound_on_", 0) == 0)
        kind = Kind::Sound;
    else if (name == "clip_id")
        kind = Kind::Clip;
    else if (name == "p_id")
        kind = Kind::Particle;
    else if (name == "effect" || EndsWith(name, "_effect"))
        kind = Kind::Effect;
    else if (EndsWith(name, "_template") && name != "group_template")
        kind = Kind::Template;
    else if (name == "video")
        kind = Kind::Video;
    else if (name == "dialog")
        kind = Kind::Window;
    else
        return false;
    return true;
}

// What the first literal argument of a script call names, by the called name.
bool CallKind(const std::string& name, Kind& kind)
{
    static const std::map<std::string, Kind> calls = {
        {"Play", Kind::Sound},          {"PlaySound", Kind::Sound},       {"AttachSound", Kind::Sound},
        {"IsSound", Kind::Sound},       {"sound", Kind::Sound},           {"GetTexture", Kind::Texture},
        {"SetTexture", Kind::Texture},  {"GetTextureSize", Kind::Texture}, {"SetHintFont", Kind::Font},
        {"GetFont", Kind::Font},        {"SetFont", Kind::Font},          {"GetClip", Kind::Clip},
        {"CParticleSystem", Kind::Particle}, {"OpenWindow", Kind::Window}, {"CreateLevel", Kind::Level},
        {"LoadScript", Kind::File},     {"CVideoPlayer", Kind::Video},    {"COpaqueVideo", Kind::Video},
        {"CTranslucentVideo", Kind::Video}, {"GetString", Kind::String},
    };
    auto found = calls.find(name);
    if (found == calls.end())
        return false;
    kind = found->second;
    return true;
}

// The ids a text names as the string table reads it: "$12" is string 12, "$$" a dollar sign.
std::vector<std::string> StringIdsIn(const std::string& text)
{
    std::vector<std::string> ids;
    for (size_t i = 0; i < text.size(); ++i) {
        if (text[i] != '$')
            continue;
        if (i + 1 < text.size() && text[i + 1] == '$') {
            ++i;
            continue;
        }
        size_t end = i + 1;
        while (end < text.size() && isdigit(static_cast<unsigned char>(text[end])))
            ++end;
        if (end > i + 1)
            ids.push_back(std::to_string(std::stoll(text.substr(i + 1, end - i - 1))));
        i = end - 1;
    }
    return ids;
}

std::string Relative(const fs::path& path, const fs::path& folder)
{
    return path.lexically_relative(folder).generic_string();
}

} // namespace

std::string Message::Format() const
{
    return line ? file + ":" + std::to_string(line) + ": " + text : file + ": " + text;
}

CLinter::CLinter(std::string folder) : m_Folder(std::move(folder))
{
    ox::misc::GamePackConfig config;
    config.folder = m_Folder;
    config.language = "";
    m_Pack = std::make_unique<ox::misc::CGamePack>(config);
}

CLinter::~CLinter() = default;

void CLinter::Error(const std::string& file, unsigned line, const std::string& text)
{
    m_Messages.push_back({file, line, text});
}

const XmlDoc* CLinter::Doc(const std::string& path) const
{
    auto found = m_Docs.find(path);
    return found == m_Docs.end() ? nullptr : &found->second;
}

bool CLinter::Exists(const std::string& path) const
{
    std::string lower = path;
    std::transform(lower.begin(), lower.end(), lower.begin(), ::tolower);
    return m_Pack->Access(path.c_str()) || m_Pack->Access(lower.c_str());
}

void CLinter::Run()
{
    ReadXmlFiles();
    CollectDeclarations();
    for (const auto& [path, doc] : m_Docs)
        if (doc.problem.empty())
            CheckXmlReferences(doc);
    if (const XmlDoc* quest = Doc("properties/quest.xml"); quest && quest->problem.empty())
        CheckQuestScripts(*quest);
    CheckScripts();
    CheckDumps();
}

void CLinter::ReadXmlFiles()
{
    std::error_code error;
    std::vector<fs::path> files;
    for (const auto& entry : fs::recursive_directory_iterator(m_Folder, error))
        if (entry.is_regular_file() && entry.path().extension() == ".xml")
            files.push_back(entry.path());
    std::sort(files.begin(), files.end());
    for (const fs::path& file : files) {
        const std::string shown = Relative(file, m_Folder);
        XmlDoc& doc = m_Docs[shown];
        if (!ReadXmlDoc(file.string(), shown, doc))
            Error(shown, 0, "cannot be read");
        else if (!doc.problem.empty())
            Error(shown, doc.problemLine, "does not parse: " + doc.problem);
    }
    if (!Doc("game.xml"))
        Error("game.xml", 0, "is missing: the game folder needs it");
}

void CLinter::CollectDeclarations()
{
    for (const auto& [path, doc] : m_Docs)
        if (doc.problem.empty())
            DeclareFrom(doc);
    // The string table, read as the game reads it.
    std::string bytes;
    std::vector<std::pair<int, ox::wstring>> texts;
    const std::string strings = m_Folder + "/properties/strings.xml";
    if (ox::misc::sys::ReadWholeFile(strings, bytes) &&
        ox::misc::CStringTable::ParseXml(bytes.data(), bytes.size(), strings, texts))
        for (const auto& text : texts)
            m_Declared[Kind::String].insert(std::to_string(text.first));
}

void CLinter::DeclareFrom(const XmlDoc& doc)
{
    const std::string& root = doc.RootName();
    const bool clips = doc.path == "properties/clips.xml" ||
                       (doc.path.rfind("clips/", 0) == 0 && doc.path != "clips/groups.xml");
    const bool particles = doc.path == "properties/particle.xml" || doc.path.rfind("properties/particles/", 0) == 0;
    for (const XmlElement& e : doc.elements) {
        const std::string& id = e.Attr("id");
        if (id.empty())
            continue;
        if (doc.path == "properties/resources.xml" && e.name == "image")
            m_Declared[Kind::Texture].insert(id);
        else if (doc.path == "properties/fonts.xml" && e.name == "font")
            m_Declared[Kind::Font].insert(id);
        else if (clips && e.name == "Clip")
            m_Declared[Kind::Clip].insert(id);
        else if (particles && e.name == "particle")
            m_Declared[Kind::Particle].insert(id);
        else if (doc.path == "properties/sounds.xml" && e.name == "sound")
            m_Declared[Kind::Sound].insert(id);
        else if (root == "GUITemplates" && EndsWith(e.name, "_template"))
            m_Declared[Kind::Template].insert(e.name + ":" + id);
        else if (root == "Effects")
            m_Declared[Kind::Effect].insert(id);
        else if (doc.path == "properties/gui.xml" && e.depth == 1)
            m_Declared[Kind::Window].insert(id);
        else if (doc.path == "properties/quest.xml" && e.name == "level")
            m_Declared[Kind::Level].insert(id);
    }
}

void CLinter::Require(Kind kind, const std::string& id, const std::string& file, unsigned line,
                      const std::string& what)
{
    bool found;
    if (kind == Kind::File || kind == Kind::Video)
        found = Exists(id);
    else
        found = m_Declared[kind].count(id) > 0;
    if (!found)
        Error(file, line, what + " names the " + KindName(kind) + " '" + id + "', which " +
                              (kind == Kind::File || kind == Kind::Video ? "is not in the game folder"
                                                                         : "is not declared"));
}

void CLinter::RequireStrings(const std::string& text, const std::string& file, unsigned line,
                             const std::string& what)
{
    for (const std::string& id : StringIdsIn(text))
        Require(Kind::String, id, file, line, what);
}

void CLinter::CheckXmlReferences(const XmlDoc& doc)
{
    // Font properties files and the string table hold no references.
    if (doc.RootName() == "Font" || doc.path == "properties/strings.xml" || doc.path.rfind("!langs/", 0) == 0)
        return;
    const bool declarations = doc.path == "properties/resources.xml" || doc.path == "properties/sounds.xml" ||
                              doc.path == "properties/fonts.xml";
    for (const XmlElement& e : doc.elements) {
        for (const auto& [name, value] : e.attributes) {
            const std::string what = "<" + e.name + "> " + name;
            if (declarations && (name == "path" || name == "file")) {
                Require(Kind::File, value, doc.path, e.line, what);
                continue;
            }
            RequireStrings(value, doc.path, e.line, what);
            Kind kind;
            if (value.empty() || IsNumber(value) || !AttributeKind(name, kind))
                continue;
            // A template is looked up among the templates of its kind.
            Require(kind, kind == Kind::Template ? name + ":" + value : value, doc.path, e.line, what);
        }
    }
}

void CLinter::CheckLuaCalls(const std::string& file, unsigned baseLine, const std::string& text)
{
    const LuaLiterals literals = ScanLua(text);
    for (const auto& [value, line] : literals.strings)
        RequireStrings(value, file, baseLine + line - 1, "a script's text");
    for (const LiteralCall& call : literals.calls) {
        Kind kind;
        if (!CallKind(call.name, kind) || call.number != (kind == Kind::String))
            continue;
        Require(kind, call.literal, file, baseLine + call.line - 1, call.name + "(...)");
    }
}

void CLinter::CheckScripts()
{
    std::error_code error;
    std::vector<fs::path> files;
    for (const auto& entry : fs::recursive_directory_iterator(m_Folder, error))
        if (entry.is_regular_file() && entry.path().extension() == ".lua")
            files.push_back(entry.path());
    std::sort(files.begin(), files.end());
    for (const fs::path& file : files) {
        const std::string shown = Relative(file, m_Folder);
        std::string text;
        if (!ox::misc::sys::ReadWholeFile(file.string(), text)) {
            Error(shown, 0, "cannot be read");
            continue;
        }
        unsigned line = 0;
        std::string what;
        if (!CompileLua(text, line, what))
            Error(shown, line, "does not compile: " + what);
        CheckLuaCalls(shown, 1, text);
    }
    if (!Exists("scripts/main.lua"))
        Error("scripts/main.lua", 0, "is missing: the game runs it at start");
}

void CLinter::CheckQuestScripts(const XmlDoc& doc)
{
    // The texts the engine compiles a fragment into, and how many lines it puts before it.
    struct Wrap {
        std::string text;
        unsigned before;
    };
    auto wrap = [](const XmlElement& e, const std::string& attribute, const std::string& body) -> Wrap {
        if (e.name == "level")
            return {"function quest.on_box_take()\n" + body + "\nend", 1};
        if (e.name == "scene")
            return {"function quest.on_show_scene(_current_scene)\n" + body + "\nend", 1};
        const bool click = attribute == "s1", inventory = attribute == "s4";
        const bool events = click || inventory;
        return {qe::CObjectScripts::MakeFunctionText("__object_script_0", body, events, click), events ? 2u : 1u};
    };
    for (const XmlElement& e : doc.elements) {
        for (const auto& [name, value] : e.attributes) {
            const bool script = (e.name == "scene" && name == "script") ||
                                ((name == "s1" || name == "s2") && e.name == "level") ||
                                (e.name != "level" && (name == "s1" || name == "s2" || name == "s3" || name == "s4"));
            if (!script || value.empty())
                continue;
            const Wrap wrapped = wrap(e, name, value);
            unsigned line = 0;
            std::string what;
            if (CompileLua(wrapped.text, line, what)) {
                CheckLuaCalls(doc.path, e.line, value);
                continue;
            }
            // A mistake the wrapper's lines show (a "return" that is not last) is one of the fragment.
            const unsigned lines = 1 + static_cast<unsigned>(std::count(value.begin(), value.end(), '\n'));
            const unsigned inFragment = std::clamp(line > wrapped.before ? line - wrapped.before : 1u, 1u, lines);
            Error(doc.path, e.line + inFragment - 1,
                  "script " + name + " of '" + e.Attr("id") + "' does not compile as the game wraps it: " + what);
        }
    }
}

} // namespace oxlint

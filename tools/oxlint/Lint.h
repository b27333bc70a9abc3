#pragma once
// oxlint's checks of one game folder: the XML files parse, every id the data and the scripts'
// literal calls name is declared, the scripts compile (quest object scripts as the engine wraps
// them) and the binary dumps agree with the XML they are made from.
#include "oxlint/XmlDoc.h"

#include <map>
#include <memory>
#include <set>
#include <string>
#include <vector>

namespace ox::misc {
class CGamePack;
}

namespace oxlint {

struct Message {
    std::string file;  // relative to the game folder
    unsigned line = 0; // 0 when the message is about the whole file
    std::string text;

    // "file:line: text"
    std::string Format() const;
};

// What an id names.
enum class Kind { Texture, Font, Clip, Particle, Sound, Video, Template, String, Effect, Window, Level, File };

class CLinter {
public:
    explicit CLinter(std::string folder);
    ~CLinter();

    // Runs every check; the messages are errors, in the order found.
    void Run();
    const std::vector<Message>& Messages() const { return m_Messages; }

private:
    void Error(const std::string& file, unsigned line, const std::string& text);

    void ReadXmlFiles();
    void CollectDeclarations();
    void DeclareFrom(const XmlDoc& doc);
    void CheckXmlReferences(const XmlDoc& doc);
    void CheckScripts();
    void CheckLuaCalls(const std::string& file, unsigned baseLine, const std::string& text);
    void CheckQuestScripts(const XmlDoc& doc);
    void CheckDumps();
    void CompareDump(const std::string& dump, const std::string& source, const std::vector<uint8_t>& built,
                     const std::string& remake);

    // An error unless `id` of `kind` is declared; `what` says where the name comes from.
    void Require(Kind kind, const std::string& id, const std::string& file, unsigned line, const std::string& what);
    void RequireStrings(const std::string& text, const std::string& file, unsigned line, const std::string& what);
    bool Exists(const std::string& path) const;
    const XmlDoc* Doc(const std::string& path) const;

    std::string m_Folder;
    std::unique_ptr<ox::misc::CGamePack> m_Pack; // the game's files, packed or loose
    std::map<std::string, XmlDoc> m_Docs; // by path relative to the folder
    std::map<Kind, std::set<std::string>> m_Declared;
    std::vector<Message> m_Messages;
};

} // namespace oxlint

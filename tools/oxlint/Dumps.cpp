// Whether the binary dumps of a game folder agree with the XML they are compiled from: each is
// compiled again in memory with the engine's own builders (those oxdump uses) and compared.
#include "oxlint/Lint.h"

#include "core/ParticlesLoader.h"
#include "core/Settings.h"
#include "core/TextureDeclarations.h"
#include "core/TexturesAlphaWriter.h"
#include "misc/GamePack.h"
#include "misc/StringTable.h"
#include "misc/animation/ClipsLoader.h"
#include "misc/sys/Path.h"
#include "quest/QuestData.h"
#include "sound/SoundDeclarations.h"

#include <unistd.h>

#include <algorithm>
#include <cstring>
#include <filesystem>

namespace fs = std::filesystem;

namespace oxlint {

namespace {

// The XML files a dump is built from: the one file if it exists, else the folder's .xml files.
std::vector<std::string> Sources(const std::string& folder, const std::string& file, const std::string& subfolder,
                                 const std::string& skip = "")
{
    std::error_code error;
    if (fs::exists(folder + "/" + file, error))
        return {folder + "/" + file};
    std::vector<std::string> files;
    for (const auto& entry : fs::directory_iterator(folder + "/" + subfolder, error))
        if (entry.is_regular_file() && entry.path().extension() == ".xml" && entry.path().filename() != skip)
            files.push_back(entry.path().string());
    std::sort(files.begin(), files.end());
    return files;
}

std::vector<uint8_t> Bytes(const uint8_t* data, size_t size)
{
    return data ? std::vector<uint8_t>(data, data + size) : std::vector<uint8_t>();
}

std::vector<uint8_t> BuildClips(const std::vector<std::string>& files)
{
    ox::misc::anim::ClipRecords clips;
    for (const std::string& file : files) {
        std::string xml;
        if (!ox::misc::sys::ReadWholeFile(file, xml) ||
            !ox::misc::anim::ConvertClipsXml(xml.data(), xml.size(), file.c_str(), clips))
            return {};
    }
    ox::misc::anim::CClipsLoader loader;
    return loader.LoadRecords(clips) ? Bytes(loader.Data(), loader.DataSize()) : std::vector<uint8_t>();
}

std::vector<uint8_t> BuildParticles(const std::vector<std::string>& files)
{
    std::vector<ox::core::ParticleDesc> records;
    for (const std::string& file : files) {
        std::string xml;
        if (!ox::misc::sys::ReadWholeFile(file, xml) ||
            !ox::core::ConvertParticlesXml(xml.data(), xml.size(), file.c_str(), records))
            return {};
    }
    ox::core::CParticlesLoader loader;
    loader.LoadRecords(std::move(records));
    return Bytes(loader.Data(), loader.DataSize());
}

std::vector<uint8_t> BuildSounds(const std::string& file)
{
    std::string xml;
    std::vector<uint8_t> block;
    if (!ox::misc::sys::ReadWholeFile(file, xml) ||
        !ox::sound::SoundDeclarationsLoader::ConvertXml(xml.data(), xml.size(), file.c_str(), block))
        return {};
    return block;
}

std::vector<uint8_t> BuildStrings(const std::string& file)
{
    std::string xml;
    std::vector<std::pair<int, ox::wstring>> texts;
    if (!ox::misc::sys::ReadWholeFile(file, xml) ||
        !ox::misc::CStringTable::ParseXml(xml.data(), xml.size(), file, texts))
        return {};
    return ox::misc::CStringTable::BuildBinary16(texts, "S16\x01");
}

std::vector<uint8_t> BuildQuest(const std::string& file)
{
    std::string xml;
    ox::core::CSettings settings;
    if (!ox::misc::sys::ReadWholeFile(file, xml) || !settings.LoadXmlFromMemory(xml.data(), xml.size(), file))
        return {};
    const ox::core::CSettingsGroup* quest = settings.GetChildRef("Quest");
    return quest ? qe::dump::Compile(*quest, file.c_str()) : std::vector<uint8_t>();
}

std::vector<uint8_t> BuildResources(const std::string& folder, ox::misc::CGamePack& pack)
{
    const std::string file = folder + "/properties/resources.xml";
    std::string xml;
    std::vector<uint8_t> bulk;
    ox::core::CTextureDeclarationsLoader loader(&pack);
    if (!ox::misc::sys::ReadWholeFile(file, xml) || !loader.ConvertXml(xml.data(), xml.size(), file.c_str(), bulk))
        return {};
    return bulk;
}

// The alpha masks of every image under textures/, as `oxdump texturesalpha textures` makes them.
std::vector<uint8_t> BuildAlpha(const std::string& folder)
{
    std::vector<ox::core::AlphaMaskFile> images;
    std::error_code error;
    for (const auto& entry : fs::recursive_directory_iterator(folder + "/textures", error)) {
        std::string extension = entry.path().extension().string();
        std::transform(extension.begin(), extension.end(), extension.begin(), ::tolower);
        if (entry.is_regular_file() && (extension == ".png" || extension == ".jpg"))
            images.push_back({entry.path().stem().string(), entry.path().string()});
    }
    std::sort(images.begin(), images.end(), [](const auto& a, const auto& b) { return a.path < b.path; });
    const std::string out = (fs::temp_directory_path() / ("oxlint-alpha-" + std::to_string(getpid()))).string();
    std::string why, bytes;
    const bool written = !images.empty() && ox::core::WriteTexturesAlpha(images, 0, out, why) &&
                         ox::misc::sys::ReadWholeFile(out, bytes);
    fs::remove(out, error);
    return written ? std::vector<uint8_t>(bytes.begin(), bytes.end()) : std::vector<uint8_t>();
}

} // namespace

void CLinter::CompareDump(const std::string& dump, const std::string& source, const std::vector<uint8_t>& built,
                          const std::string& remake)
{
    std::string bytes;
    if (!ox::misc::sys::ReadWholeFile(m_Folder + "/" + dump, bytes))
        return;
    if (built.empty())
        Error(dump, 0, "cannot be checked: " + source + " does not compile");
    else if (bytes.size() != built.size() || memcmp(bytes.data(), built.data(), built.size()) != 0)
        Error(dump, 0, "does not agree with " + source + "; make it again with " + remake);
}

void CLinter::CheckDumps()
{
    const std::string& f = m_Folder;
    CompareDump("properties/resources.bindump", "properties/resources.xml", BuildResources(f, *m_Pack),
                "oxdump resources");
    CompareDump("properties/clips.bindump", "the clips", BuildClips(Sources(f, "properties/clips.xml", "clips", "groups.xml")),
                "oxdump clips");
    CompareDump("properties/particles.bindump", "the particle systems",
                BuildParticles(Sources(f, "properties/particle.xml", "properties/particles")), "oxdump particles");
    CompareDump("properties/sounds.bindump", "properties/sounds.xml", BuildSounds(f + "/properties/sounds.xml"),
                "oxdump sounds");
    CompareDump("properties/strings.bindump", "properties/strings.xml", BuildStrings(f + "/properties/strings.xml"),
                "oxdump strings");
    CompareDump("properties/quest.bindump", "properties/quest.xml", BuildQuest(f + "/properties/quest.xml"),
                "oxdump quest");
    CompareDump("properties/texturesalpha.bindump", "the images under textures/", BuildAlpha(f),
                "oxdump texturesalpha textures");
}

} // namespace oxlint

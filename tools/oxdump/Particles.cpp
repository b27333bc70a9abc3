#include "oxdump/Particles.h"

#include "core/ParticlesLoader.h"
#include "misc/sys/Path.h"

#include <strings.h>

#include <algorithm>
#include <cstdio>
#include <filesystem>
#include <string>
#include <vector>

namespace fs = std::filesystem;
using ox::core::CParticlesLoader;
using ox::core::ParticleDesc;

namespace oxdump {

const char* const kParticlesHelp =
    "usage: oxdump particles <particle.xml|folder> <out>\n"
    "\n"
    "Compiles particle systems into properties/particles.bindump, the table the game uses in\n"
    "place: one 384-byte record per <particle> element, sorted by id. The input is one XML\n"
    "file (the game's properties/particle.xml) or a folder whose every .xml file holds\n"
    "particles (the game's properties/particles/). Values that cannot be read are reported\n"
    "with their record and keep their defaults.\n";

namespace {

std::vector<std::string> XmlFiles(const std::string& folder)
{
    std::vector<std::string> files;
    std::error_code error;
    for (const auto& entry : fs::directory_iterator(folder, error)) {
        const std::string name = entry.path().filename().string();
        if (entry.is_regular_file() && name.size() > 4 && strcasecmp(name.c_str() + name.size() - 4, ".xml") == 0)
            files.push_back(entry.path().string());
    }
    std::sort(files.begin(), files.end());
    return files;
}

void PrintColour(const char* name, const ox::graphics::Color& c)
{
    printf(" %s 0x%08X", name, c.GetARGB());
}

void ShowRecord(const ParticleDesc& d)
{
    printf("particle %s texture '%s' at %g,%g flags 0x%X\n", d.id.c_str(), d.tex_id.c_str(), d.pos.X, d.pos.Y,
           d.flags);
    printf("  emission %g, cap %d, system life %gms, particle life %g..%gms\n", d.emission, d.max_life_particles,
           d.system_life_time, d.life_time_min, d.life_time_max);
    printf("  emitter type %d size %gx%g angle %g, direction %g spread %g, speed %g..%g\n", d.emiter_type,
           d.emiter_size.X, d.emiter_size.Y, d.emiter_angle, d.direction, d.spread, d.start_speed_min,
           d.start_speed_max);
    printf("  radial %g..%g tangential %g..%g gravity %g..%g wind %g..%g at %g\n", d.rad_acc_min, d.rad_acc_max,
           d.tang_acc_min, d.tang_acc_max, d.grav_min, d.grav_max, d.wind_min, d.wind_max, d.wind_direction);
    printf("  spin %g %g %g %g %g, size %g %g %g %g %g\n", d.spin.start, d.spin.mid, d.spin.end, d.spin.var,
           d.spin.base_var, d.size.start, d.size.mid, d.size.end, d.size.var, d.size.base_var);
    printf(" ");
    PrintColour("start", d.start_color);
    PrintColour("mid", d.mid_color);
    PrintColour("end", d.end_color);
    PrintColour("var", d.var_color);
    PrintColour("base_var", d.base_var_color);
    printf("\n");
}

} // namespace

int Particles(int argc, char** argv)
{
    if (argc != 4) {
        fprintf(stderr, "oxdump: particles needs <particle.xml|folder> <out>\n%s", kParticlesHelp);
        return 2;
    }
    const std::string input = argv[2], output = argv[3];
    std::error_code error;
    const std::vector<std::string> files = fs::is_directory(input, error) ? XmlFiles(input) : std::vector {input};
    std::vector<ParticleDesc> records;
    for (const std::string& file : files) {
        std::string xml;
        if (!ox::misc::sys::ReadWholeFile(file, xml)) {
            fprintf(stderr, "oxdump: cannot read %s\n", file.c_str());
            return 1;
        }
        if (!ox::core::ConvertParticlesXml(xml.data(), xml.size(), file.c_str(), records)) {
            fprintf(stderr, "oxdump: %s is not valid\n", file.c_str());
            return 1;
        }
    }
    CParticlesLoader loader;
    loader.LoadRecords(std::move(records));
    if (!ox::misc::sys::WriteFileAtomically(output, loader.Data(), loader.DataSize())) {
        fprintf(stderr, "oxdump: cannot write %s\n", output.c_str());
        return 1;
    }
    printf("%s: %u particle systems, %zu bytes\n", output.c_str(), loader.Count(), loader.DataSize());
    return 0;
}

bool ShowParticles(const uint8_t* data, size_t size, const char* name)
{
    CParticlesLoader loader;
    if (!loader.LoadFromMemory(data, size, name))
        return false;
    printf("particles, version %u: %u systems\n", ox::core::kParticlesVersion, loader.Count());
    for (uint32_t i = 0; i < loader.Count(); ++i)
        ShowRecord(loader.Records()[i]);
    return true;
}

} // namespace oxdump

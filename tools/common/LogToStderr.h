#pragma once
// For the content tools: while it lives, the library's log goes to a temporary file; at the
// end the warnings and errors among its lines are shown on standard error, since they say
// what was wrong with the input.
#include "diag/Log.h"

#include <unistd.h>

#include <cstdio>
#include <filesystem>
#include <fstream>
#include <string>

namespace oxtools {

class LogToStderr {
public:
    explicit LogToStderr(const char* tool)
        : m_Path((std::filesystem::temp_directory_path() / (std::string(tool) + "-" + std::to_string(getpid()) + ".log"))
                     .string())
    {
        ox::diag::Log::Instance().SetFile(m_Path);
    }
    ~LogToStderr()
    {
        ox::diag::Log::Instance().Close();
        std::ifstream in(m_Path);
        for (std::string line; std::getline(in, line);) {
            size_t at = line.find("][3]: ");
            if (at == std::string::npos)
                at = line.find("][2]: ");
            if (at != std::string::npos)
                fprintf(stderr, "  %s\n", line.substr(at + 6).c_str());
        }
        std::error_code ignored;
        std::filesystem::remove(m_Path, ignored);
    }
    LogToStderr(const LogToStderr&) = delete;
    LogToStderr& operator=(const LogToStderr&) = delete;

private:
    std::string m_Path;
};

} // namespace oxtools

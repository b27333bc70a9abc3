#include "support/TestSupport.h"

#include "diag/Log.h"
#include "misc/Unicode.h"

#include <cstdlib>
#include <fstream>
#include <random>
#include <sstream>

namespace oxtest {

TempDir::TempDir()
{
    std::random_device random;
    for (;;) {
        fs::path candidate = fs::temp_directory_path() / ("oxtest-" + std::to_string(random()));
        if (fs::create_directory(candidate)) {
            m_Path = candidate;
            break;
        }
    }
}

TempDir::~TempDir()
{
    std::error_code ignored;
    fs::remove_all(m_Path, ignored);
}

fs::path TempDir::Write(const std::string& relative, const std::string& content) const
{
    fs::path path = m_Path / relative;
    fs::create_directories(path.parent_path());
    std::ofstream out(path, std::ios::binary);
    out << content;
    return path;
}

std::string ReadFile(const fs::path& path)
{
    std::ifstream in(path, std::ios::binary);
    std::stringstream buffer;
    buffer << in.rdbuf();
    return buffer.str();
}

ScopedCwd::ScopedCwd(const fs::path& path) : m_Previous(fs::current_path()) { fs::current_path(path); }
ScopedCwd::~ScopedCwd() { fs::current_path(m_Previous); }

ScopedEnv::ScopedEnv(const char* name, const char* value) : m_Name(name)
{
    const char* previous = getenv(name);
    m_HadValue = previous != nullptr;
    if (previous)
        m_Previous = previous;
    if (value)
        setenv(name, value, 1);
    else
        unsetenv(name);
}

ScopedEnv::~ScopedEnv()
{
    if (m_HadValue)
        setenv(m_Name.c_str(), m_Previous.c_str(), 1);
    else
        unsetenv(m_Name.c_str());
}

AssertCapture::AssertCapture()
{
    m_Previous = ox::diag::SetAssertHandler([this](const ox::wchar* expression, const ox::wchar* file, int line) {
        m_Failures.push_back({Narrow(expression), Narrow(file), line});
    });
}

AssertCapture::~AssertCapture() { ox::diag::SetAssertHandler(m_Previous); }

bool AssertCapture::Has(const std::string& expression) const
{
    for (const auto& failure : m_Failures)
        if (failure.expression == expression)
            return true;
    return false;
}

LogCapture::LogCapture() { ox::diag::Log::Instance().SetFile((m_Dir / "log.oxlog").string()); }

LogCapture::~LogCapture() { ox::diag::Log::Instance().Close(); }

std::vector<std::string> LogCapture::Lines() const
{
    ox::diag::Log::Instance().Flush();
    std::vector<std::string> lines;
    std::istringstream in(ReadFile(m_Dir / "log.oxlog"));
    for (std::string line; std::getline(in, line);)
        lines.push_back(line);
    return lines;
}

std::vector<std::string> LogCapture::Entries() const
{
    std::vector<std::string> entries;
    for (const std::string& line : Lines()) {
        // "[hh:mm:ss:mmm][channel][level]: text"
        size_t a = line.find("][");
        size_t b = line.find("][", a + 2);
        size_t c = line.find("]: ", b + 2);
        if (line.empty() || line[0] != '[' || a == std::string::npos || b == std::string::npos ||
            c == std::string::npos) {
            if (!entries.empty())
                entries.back() += "\n" + line; // continuation of a multi-line text
            continue;
        }
        entries.push_back(line.substr(a + 2, b - a - 2) + "|" + line.substr(b + 2, c - b - 2) + "|" +
                          line.substr(c + 3));
    }
    return entries;
}

bool LogCapture::Contains(const std::string& text) const
{
    for (const std::string& line : Lines())
        if (line.find(text) != std::string::npos)
            return true;
    return false;
}

MessageCapture::MessageCapture()
{
    m_Previous = ox::diag::message::SetSink(
        [this](const std::string& caption, const std::string& text) { m_Boxes.push_back({caption, text}); });
}

MessageCapture::~MessageCapture() { ox::diag::message::SetSink(m_Previous); }

std::string Narrow(const ox::wstring& text) { return ox::misc::WideToUtf8(text); }

} // namespace oxtest

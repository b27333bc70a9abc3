#pragma once
// Helpers shared by every test: temporary folders, working-folder changes, a controllable
// clock, and captures of assertions, log lines and message boxes.
#include "diag/Assert.h"
#include "diag/Message.h"
#include "misc/WideChar.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <string>
#include <vector>

namespace oxtest {

namespace fs = std::filesystem;

// A fresh folder under the system's temporary folder, removed with everything in it.
class TempDir {
public:
    TempDir();
    ~TempDir();
    TempDir(const TempDir&) = delete;
    TempDir& operator=(const TempDir&) = delete;
    const fs::path& Path() const { return m_Path; }
    fs::path operator/(const std::string& name) const { return m_Path / name; }
    // Writes a file (creating its folders) and returns its path.
    fs::path Write(const std::string& relative, const std::string& content) const;

private:
    fs::path m_Path;
};

std::string ReadFile(const fs::path& path);

// Changes the working folder for its lifetime.
class ScopedCwd {
public:
    explicit ScopedCwd(const fs::path& path);
    ~ScopedCwd();

private:
    fs::path m_Previous;
};

// Sets an environment variable for its lifetime.
class ScopedEnv {
public:
    ScopedEnv(const char* name, const char* value);
    ~ScopedEnv();

private:
    std::string m_Name;
    std::string m_Previous;
    bool m_HadValue;
};

// A millisecond clock the test moves by hand. Copies of Source() read the same clock.
class FakeClock {
public:
    double Now() const { return *m_Now; }
    void Advance(double ms) { *m_Now += ms; }
    void Set(double ms) { *m_Now = ms; }
    std::function<double()> Source() const { auto now = m_Now; return [now] { return *now; }; }
    std::function<uint32_t()> Ticks() const { auto now = m_Now; return [now] { return static_cast<uint32_t>(*now); }; }

private:
    std::shared_ptr<double> m_Now = std::make_shared<double>(0.0);
};

// Turns failed assertions into records while it lives: the code under test goes on.
class AssertCapture {
public:
    struct Failure {
        std::string expression;
        std::string file;
        int line;
    };
    AssertCapture();
    ~AssertCapture();
    const std::vector<Failure>& Failures() const { return m_Failures; }
    size_t Count() const { return m_Failures.size(); }
    bool Has(const std::string& expression) const;
    void Clear() { m_Failures.clear(); }

private:
    std::vector<Failure> m_Failures;
    ox::diag::AssertHandler m_Previous;
};

// Points the process-wide log at a temporary file while it lives, and reads it back.
class LogCapture {
public:
    LogCapture();
    ~LogCapture();
    // Every line written so far (the file is flushed first), headers included.
    std::vector<std::string> Lines() const;
    // Lines with the header removed: "[channel][level]: text" becomes "channel|level|text".
    std::vector<std::string> Entries() const;
    bool Contains(const std::string& text) const;

private:
    TempDir m_Dir;
};

// Records message boxes instead of showing them.
class MessageCapture {
public:
    struct Box {
        std::string caption;
        std::string text;
    };
    MessageCapture();
    ~MessageCapture();
    const std::vector<Box>& Boxes() const { return m_Boxes; }

private:
    std::vector<Box> m_Boxes;
    ox::diag::message::Sink m_Previous;
};

std::string Narrow(const ox::wstring& text);

} // namespace oxtest

// The statement must fail the contract whose expression text is given.
#define EXPECT_CONTRACT_FAILURE(statement, expression_text)                                          \
    do {                                                                                        \
        ::oxtest::AssertCapture oxtest_capture_;                                                \
        statement;                                                                              \
        EXPECT_TRUE(oxtest_capture_.Has(expression_text))                                            \
            << "expected contract failure \"" << (expression_text) << "\", got "                   \
            << oxtest_capture_.Count() << " failure(s)"                                         \
            << (oxtest_capture_.Count() ? ", first \"" + oxtest_capture_.Failures()[0].expression + "\"" \
                                        : std::string());                                       \
    } while (0)

#pragma once
// A fresh configuration directory (and runtime directory) for one test:
// VAROSCOPE_HOME and XDG_RUNTIME_DIR point into a new temporary folder while
// the object lives, and everything is put back and removed afterwards.

#include <cstdlib>
#include <filesystem>
#include <optional>
#include <string>

namespace qv::test {

/// Sets an environment variable for the object's lifetime.
class ScopedEnvironment {
public:
    ScopedEnvironment(const char* name, const std::string& value) : name_(name)
    {
        if (const char* old = std::getenv(name))
            previous_ = old;
        setenv(name, value.c_str(), 1);
    }
    ~ScopedEnvironment()
    {
        if (previous_)
            setenv(name_.c_str(), previous_->c_str(), 1);
        else
            unsetenv(name_.c_str());
    }
    ScopedEnvironment(const ScopedEnvironment&) = delete;
    ScopedEnvironment& operator=(const ScopedEnvironment&) = delete;

private:
    std::string name_;
    std::optional<std::string> previous_;
};

class TemporaryHome {
public:
    TemporaryHome()
        : root_(MakeRoot()), home_("VAROSCOPE_HOME", (root_ / "home").string()),
          runtime_("XDG_RUNTIME_DIR", (root_ / "run").string())
    {
        std::filesystem::create_directories(root_ / "home");
        std::filesystem::create_directories(root_ / "run");
    }
    ~TemporaryHome()
    {
        std::error_code ignored;
        std::filesystem::remove_all(root_, ignored);
    }

    std::filesystem::path Home() const { return root_ / "home"; }
    std::filesystem::path Runtime() const { return root_ / "run"; }

private:
    static std::filesystem::path MakeRoot()
    {
        std::string pattern = (std::filesystem::temp_directory_path() / "varoscope-test-XXXXXX").string();
        if (mkdtemp(pattern.data()) == nullptr)
            throw std::filesystem::filesystem_error("mkdtemp", std::error_code(errno, std::generic_category()));
        return pattern;
    }

    std::filesystem::path root_;
    ScopedEnvironment home_;
    ScopedEnvironment runtime_;
};

} // namespace qv::test

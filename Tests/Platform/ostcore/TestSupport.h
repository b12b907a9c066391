// What several tests of the platform core need: a directory of their own, and variables of the environment.
#pragma once

#include <cstdlib>
#include <optional>
#include <stdexcept>
#include <string>

#include "ostcore/filesupport/Dir.h"

namespace ostcore_test {

class TemporaryDirectory {
public:
    TemporaryDirectory() {
        std::string pattern = "/tmp/zo-ostcore-XXXXXX";
        if (!::mkdtemp(pattern.data())) {
            throw std::runtime_error("no temporary directory");
        }
        mDir = ostcore::filesupport::Dir(pattern);
    }
    ~TemporaryDirectory() { mDir.RemoveAll(); }
    TemporaryDirectory(const TemporaryDirectory&) = delete;
    TemporaryDirectory& operator=(const TemporaryDirectory&) = delete;

    std::string Path(const std::string& inName) const { return mDir.FilePath(inName); }
    const ostcore::filesupport::Dir& Dir() const { return mDir; }

private:
    ostcore::filesupport::Dir mDir;
};

/// Sets a variable for a scope.
class ScopedVariable {
public:
    ScopedVariable(const char* inName, const std::string& inValue) : mName(inName) {
        if (const char* former = std::getenv(inName)) {
            mFormer = former;
        }
        ::setenv(inName, inValue.c_str(), 1);
    }
    ~ScopedVariable() {
        if (mFormer) {
            ::setenv(mName, mFormer->c_str(), 1);
        } else {
            ::unsetenv(mName);
        }
    }
    ScopedVariable(const ScopedVariable&) = delete;
    ScopedVariable& operator=(const ScopedVariable&) = delete;

private:
    const char* const mName;
    std::optional<std::string> mFormer;
};

}  // namespace ostcore_test

// The developers' switches.
#include "ostcore/debug/DebugDatabase.h"

#include <atomic>
#include <charconv>
#include <cstdlib>

#include <unistd.h>

#include "ostcore/config/StateDirectories.h"
#include "ostcore/filesupport/File.h"
#include "ostcore/threads/Mutex.h"
#include "ostcore/utility/StringConversion.h"

namespace ostcore {
namespace debug {
namespace {

using threads::Mutex;
using threads::MutexLock;
using utility::EqualsIgnoreCaseASCII;
using Values = std::map<std::string, std::string, std::less<>>;

std::string_view Trimmed(std::string_view inText) {
    constexpr std::string_view kBlanks = " \t\r\n";
    const std::size_t first = inText.find_first_not_of(kBlanks);
    if (first == std::string_view::npos) {
        return {};
    }
    return inText.substr(first, inText.find_last_not_of(kBlanks) - first + 1);
}

std::string FilePath() {
    if (const char* path = std::getenv("ZOCLIENT_DEBUG_DB"); path && *path) {
        return path;
    }
    return config::GetConfigDirectory().FilePath("debug.conf");
}

void ReadLine(std::string_view inLine, Values& ioValues) {
    const std::string_view text = Trimmed(inLine);
    const std::size_t equals = text.find('=');
    if (!text.empty() && text.front() != '#' && equals != std::string_view::npos) {
        ioValues[std::string(Trimmed(text.substr(0, equals)))] =
            std::string(Trimmed(text.substr(equals + 1)));
    }
}

Values ReadFile() {
    constexpr std::size_t kLargestFile = 1024 * 1024;
    Values values;
    const auto content = filesupport::File::Read(FilePath(), kLargestFile);
    std::string_view text = content ? content->view() : std::string_view();
    while (!text.empty()) {
        const std::size_t end = std::min(text.find('\n'), text.size());
        ReadLine(text.substr(0, end), values);
        text.remove_prefix(std::min(end + 1, text.size()));
    }
    return values;
}

// Taken at once with the file, so that later changes of the environment by the host race with nothing here.
Values ReadEnvironment() {
    constexpr std::string_view kPrefix = "ZOCLIENT_DEBUG_";
    Values values;
    for (char** entry = environ; entry && *entry; ++entry) {
        const std::string_view text(*entry);
        const std::size_t equals = text.find('=');
        if (text.substr(0, kPrefix.size()) == kPrefix && equals != std::string_view::npos) {
            values[std::string(text.substr(kPrefix.size(), equals - kPrefix.size()))] =
                std::string(text.substr(equals + 1));
        }
    }
    return values;
}

std::string EnvironmentName(std::string_view inKey) {
    std::string name(inKey);
    std::replace(name.begin(), name.end(), '.', '_');
    return name;
}

class Database {
public:
    optional<std::string> Find(std::string_view inKey) ZO_EXCLUDES(mMutex) {
        if (mHasNothing.load(std::memory_order_acquire)) {
            return {};
        }
        MutexLock lock(mMutex);
        if (!mIsRead) {
            mFile = ReadFile();
            mEnvironment = ReadEnvironment();
            mIsRead = true;
            mHasNothing = mFile.empty() && mEnvironment.empty() && mOverrides.empty();
        }
        if (const auto found = mOverrides.find(inKey); found != mOverrides.end()) {
            return found->second;
        }
        if (const auto found = mEnvironment.find(EnvironmentName(inKey)); found != mEnvironment.end()) {
            return found->second;
        }
        if (const auto found = mFile.find(inKey); found != mFile.end()) {
            return found->second;
        }
        return {};
    }

    void SetOverride(std::string_view inKey, std::string_view inValue) ZO_EXCLUDES(mMutex) {
        MutexLock lock(mMutex);
        mOverrides[std::string(inKey)] = std::string(inValue);
        mHasNothing = false;
    }

    void ClearOverrides() ZO_EXCLUDES(mMutex) {
        MutexLock lock(mMutex);
        mOverrides.clear();
    }

    void Forget() ZO_EXCLUDES(mMutex) {
        MutexLock lock(mMutex);
        mIsRead = false;
        mHasNothing = false;
    }

private:
    Mutex mMutex;
    /// As it is on nearly every machine: requests ask too, and need no lock then.
    std::atomic<bool> mHasNothing{false};
    bool mIsRead ZO_GUARDED_BY(mMutex) = false;
    Values mFile ZO_GUARDED_BY(mMutex);
    Values mEnvironment ZO_GUARDED_BY(mMutex);
    Values mOverrides ZO_GUARDED_BY(mMutex);
};

Database& TheDatabase() {
    static Database* const database = new Database;
    return *database;
}

bool IsOneOf(std::string_view inText, std::initializer_list<std::string_view> inWords) {
    return std::any_of(inWords.begin(), inWords.end(),
                       [&](std::string_view inWord) { return EqualsIgnoreCaseASCII(inText, inWord); });
}

optional<std::uint32_t> ParseUInt32(std::string_view inText) {
    int base = 10;
    if (inText.size() > 2 && inText[0] == '0' && (inText[1] == 'x' || inText[1] == 'X')) {
        inText.remove_prefix(2);
        base = 16;
    }
    std::uint32_t value = 0;
    const auto [end, error] = std::from_chars(inText.data(), inText.data() + inText.size(), value, base);
    if (error != std::errc() || end != inText.data() + inText.size()) {
        return {};
    }
    return value;
}

}  // namespace

bool DebugDatabase::GetBool(std::string_view inKey, bool inDefault) {
    const optional<std::string> value = TheDatabase().Find(inKey);
    if (value && IsOneOf(*value, {"true", "yes", "on", "1"})) {
        return true;
    }
    if (value && IsOneOf(*value, {"false", "no", "off", "0"})) {
        return false;
    }
    return inDefault;
}

std::uint32_t DebugDatabase::GetUInt32(std::string_view inKey, std::uint32_t inDefault) {
    const optional<std::string> value = TheDatabase().Find(inKey);
    return value ? ParseUInt32(*value).value_or(inDefault) : inDefault;
}

std::string DebugDatabase::GetString(std::string_view inKey, std::string_view inDefault) {
    return TheDatabase().Find(inKey).value_or(std::string(inDefault));
}

void DebugDatabase::SetOverride(std::string_view inKey, std::string_view inValue) {
    TheDatabase().SetOverride(inKey, inValue);
}

void DebugDatabase::ClearOverrides() {
    TheDatabase().ClearOverrides();
}

void DebugDatabase::Reload() {
    TheDatabase().Forget();
}

}  // namespace debug
}  // namespace ostcore

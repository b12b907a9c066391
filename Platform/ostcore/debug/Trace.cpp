// Channels, levels and the sink of traces.
#include "ostcore/debug/Trace.h"

#include <charconv>
#include <cstdlib>

#include <spdlog/logger.h>
#include <spdlog/sinks/stdout_sinks.h>
#include <sys/syscall.h>
#include <unistd.h>

#include "ostcore/debug/DebugDatabase.h"
#include "ostcore/threads/Mutex.h"

namespace ostcore {
namespace debug {
namespace detail {

// Above every level until the levels are known, so that the first question looks them up.
std::atomic<int> gHighestLevel{kTraceLevel_Progress};

}  // namespace detail

namespace {

using threads::Mutex;
using threads::MutexLock;

constexpr std::string_view kAllChannels = "*";

struct LevelSetting {
    std::string channel;
    int level;
};

std::string_view Trimmed(std::string_view inText) {
    const std::size_t first = inText.find_first_not_of(" \t\r");
    return first == std::string_view::npos
               ? std::string_view()
               : inText.substr(first, inText.find_last_not_of(" \t\r") - first + 1);
}

optional<LevelSetting> ParseSetting(std::string_view inText) {
    const std::size_t colon = inText.rfind(':');
    if (colon == std::string_view::npos) {
        return {};
    }
    const std::string_view channel = Trimmed(inText.substr(0, colon));
    const std::string_view number = Trimmed(inText.substr(colon + 1));
    int level = 0;
    const auto [end, error] = std::from_chars(number.data(), number.data() + number.size(), level);
    const bool isRead = error == std::errc() && end == number.data() + number.size();
    if (channel.empty() || !isRead || level < kTraceLevel_Off || level > kTraceLevel_Progress) {
        return {};
    }
    return LevelSetting{std::string(channel), level};
}

std::vector<LevelSetting> ParseSettings(std::string_view inList, int& outUnread) {
    std::vector<LevelSetting> settings;
    outUnread = 0;
    while (!inList.empty()) {
        const std::size_t end = std::min(inList.find_first_of(",\n"), inList.size());
        const std::string_view entry = Trimmed(inList.substr(0, end));
        inList.remove_prefix(std::min(end + 1, inList.size()));
        if (entry.empty()) {
            continue;
        }
        if (const optional<LevelSetting> setting = ParseSetting(entry)) {
            settings.push_back(*setting);
        } else {
            ++outUnread;
        }
    }
    return settings;
}

/// The levels that are set, and those that follow from them for each channel that somebody asked about. The
/// atomics are never freed, since channels of static lifetime point at them.
class LevelTable {
public:
    const std::atomic<int>* LevelOf(std::string_view inChannel) ZO_EXCLUDES(mMutex) {
        MutexLock lock(mMutex);
        const auto found = mLevels.find(inChannel);
        if (found != mLevels.end()) {
            return found->second.get();
        }
        auto level = std::make_unique<std::atomic<int>>(Resolve(inChannel));
        return mLevels.emplace(std::string(inChannel), std::move(level)).first->second.get();
    }

    // Asks without noting the channel, so that names from outside cannot fill the table.
    bool IsEnabled(std::string_view inChannel, int inLevel) const ZO_EXCLUDES(mMutex) {
        MutexLock lock(mMutex);
        const auto found = mLevels.find(inChannel);
        return inLevel <= (found != mLevels.end() ? found->second->load() : Resolve(inChannel));
    }

    void Set(const std::vector<LevelSetting>& inSettings) ZO_EXCLUDES(mMutex) {
        MutexLock lock(mMutex);
        Apply(inSettings);
    }

    void Replace(const std::vector<LevelSetting>& inSettings) ZO_EXCLUDES(mMutex) {
        MutexLock lock(mMutex);
        mSettings.clear();
        Apply(inSettings);
    }

    std::string AsText() const ZO_EXCLUDES(mMutex) {
        std::string text;
        MutexLock lock(mMutex);
        for (const auto& [channel, level] : mSettings) {
            text += channel + ":" + std::to_string(level) + "\n";
        }
        return text;
    }

private:
    void Apply(const std::vector<LevelSetting>& inSettings) ZO_REQUIRES(mMutex) {
        for (const LevelSetting& setting : inSettings) {
            mSettings[setting.channel] = setting.level;
        }
        int highest = Resolve(kAllChannels);
        for (const auto& setting : mSettings) {
            highest = std::max(highest, setting.second);
        }
        for (auto& [channel, level] : mLevels) {
            level->store(Resolve(channel), std::memory_order_relaxed);
        }
        detail::gHighestLevel.store(highest, std::memory_order_relaxed);
    }

    // The setting of the channel or of the nearest one above it.
    int Resolve(std::string_view inChannel) const ZO_REQUIRES(mMutex) {
        for (std::string_view name = inChannel; !name.empty();) {
            if (const auto found = mSettings.find(name); found != mSettings.end()) {
                return found->second;
            }
            const std::size_t dot = name.rfind('.');
            name = dot == std::string_view::npos ? std::string_view() : name.substr(0, dot);
        }
        const auto all = mSettings.find(kAllChannels);
        return all != mSettings.end() ? all->second : kTraceLevel_Fatal;
    }

    mutable Mutex mMutex;
    std::map<std::string, int, std::less<>> mSettings ZO_GUARDED_BY(mMutex);
    std::map<std::string, std::unique_ptr<std::atomic<int>>, std::less<>> mLevels ZO_GUARDED_BY(mMutex);
};

std::vector<LevelSetting> ReadSettingsFromOutside() {
    int unread = 0;
    std::vector<LevelSetting> settings = ParseSettings(DebugDatabase::GetString("ostcore.Trace", ""), unread);
    if (const char* environment = std::getenv("ZOCLIENT_TRACE")) {
        for (LevelSetting& setting : ParseSettings(environment, unread)) {
            settings.push_back(std::move(setting));
        }
    }
    return settings;
}

LevelTable& TheLevels() {
    static LevelTable* const table = [] {
        auto* const made = new LevelTable;
        made->Set(ReadSettingsFromOutside());
        return made;
    }();
    return *table;
}

struct SinkHolder {
    Mutex mutex;
    shared_ptr<TraceSink> sink ZO_GUARDED_BY(mutex);
};

SinkHolder& TheSink() {
    static SinkHolder* const holder = new SinkHolder;
    return *holder;
}

shared_ptr<TraceSink> CurrentSink() {
    SinkHolder& holder = TheSink();
    MutexLock lock(holder.mutex);
    return holder.sink;
}

// Of our own and not registered, so that a host's use of the same engine is not touched.
void WriteToStandardError(const std::string& inLine) {
    static spdlog::logger* const logger = [] {
        auto* const made = new spdlog::logger("zoclient", std::make_shared<spdlog::sinks::stderr_sink_mt>());
        made->set_pattern("%v");
        made->set_level(spdlog::level::info);
        return made;
    }();
    logger->log(spdlog::level::info, spdlog::string_view_t(inLine.data(), inLine.size()));
}

long CurrentThreadNumber() {
    thread_local const long number = ::syscall(SYS_gettid);
    return number;
}

// One trace is one line, also when a peer's text tries to look like more.
void AppendAsOneLine(std::string& ioLine, std::string_view inText) {
    constexpr char kHexDigits[] = "0123456789abcdef";
    for (const char c : inText) {
        const auto byte = static_cast<unsigned char>(c);
        if (c == '\n') {
            ioLine += "\\n";
        } else if (c == '\r') {
            ioLine += "\\r";
        } else if ((byte < 0x20 && c != '\t') || byte == 0x7F) {
            ioLine += {'\\', 'x', kHexDigits[byte >> 4], kHexDigits[byte & 0xF]};
        } else {
            ioLine.push_back(c);
        }
    }
}

}  // namespace

namespace detail {

bool IsChannelEnabled(std::string_view inChannel, int inLevel) {
    return TheLevels().IsEnabled(inChannel, inLevel);
}

}  // namespace detail

TraceChannel::TraceChannel(const char* inName) : mName(inName), mLevel(TheLevels().LevelOf(inName)) {}

void Trace(std::string_view inChannel, int inLevel, std::string_view inText) {
    if (!TraceEnabled(inChannel, inLevel)) {
        return;
    }
    std::string line("<");
    line.append(std::to_string(CurrentThreadNumber())).append("> <").append(inChannel).append("> <");
    line.append(std::to_string(inLevel)).append("> ");
    AppendAsOneLine(line, RedactSecrets(inText));
    const shared_ptr<TraceSink> sink = CurrentSink();
    try {
        if (sink) {
            (*sink)(line);
        } else {
            WriteToStandardError(line);
        }
    } catch (...) {
        // A trace must not become the failure that it tells of.
    }
}

void SetTraceLevel(std::string_view inChannel, int inLevel) {
    TheLevels().Set(
        {LevelSetting{std::string(inChannel), std::clamp(inLevel, kTraceLevel_Off, kTraceLevel_Progress)}});
}

int SetTraceLevels(std::string_view inList) {
    int unread = 0;
    TheLevels().Set(ParseSettings(inList, unread));
    return unread;
}

void ReloadTraceLevels() {
    TheLevels().Replace(ReadSettingsFromOutside());
}

std::string GetTraceDatabaseAsString() {
    return TheLevels().AsText();
}

void SetTraceDatabaseFromString(std::string_view inText) {
    int unread = 0;
    TheLevels().Replace(ParseSettings(inText, unread));
}

TraceSink SetTraceSink(TraceSink inSink) {
    const bool isEmpty = inSink.empty();
    shared_ptr<TraceSink> next = isEmpty ? nullptr : boost::make_shared<TraceSink>(std::move(inSink));
    SinkHolder& holder = TheSink();
    {
        MutexLock lock(holder.mutex);
        next.swap(holder.sink);
    }
    return next ? *next : TraceSink();
}

StructuredText& StructuredText::Add(std::string_view inKey, std::string_view inValue) {
    mText.append(", ").append(inKey).append(": ").append(inValue);
    return *this;
}

StructuredText& StructuredText::Add(std::string_view inKey, std::int64_t inValue) {
    return Add(inKey, std::string_view(std::to_string(inValue)));
}

}  // namespace debug
}  // namespace ostcore

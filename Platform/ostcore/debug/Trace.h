// Traces by channel and level: cheap when off, free of secrets when on.
#pragma once

#include <atomic>
#include <cstdint>
#include <string>
#include <string_view>

#include "ostcore/Export.h"
#include "ostcore/Types.h"

namespace ostcore {
namespace debug {

/// Levels run from 0 to 8.
constexpr int kTraceLevel_Fatal = 0;
constexpr int kTraceLevel_Error = 5;
constexpr int kTraceLevel_Lifetime = 6;
constexpr int kTraceLevel_LifetimeDetail = 7;
constexpr int kTraceLevel_Progress = 8;
/// A channel with this level is silent.
constexpr int kTraceLevel_Off = -1;

/// A channel whose level is kept at hand, so that the question whether it is on is one atomic load. Make it
/// once per channel, with static lifetime. Channels of one name share their level.
class ZOPLATFORM_EXPORT TraceChannel {
public:
    explicit TraceChannel(const char* inName);
    TraceChannel(const TraceChannel&) = delete;
    TraceChannel& operator=(const TraceChannel&) = delete;

    const char* Name() const noexcept { return mName; }
    bool IsEnabled(int inLevel) const noexcept { return inLevel <= mLevel->load(std::memory_order_relaxed); }

private:
    const char* const mName;
    const std::atomic<int>* const mLevel;
};

namespace detail {
/// The highest level of any channel.
ZOPLATFORM_EXPORT extern std::atomic<int> gHighestLevel;
ZOPLATFORM_EXPORT bool IsChannelEnabled(std::string_view inChannel, int inLevel);
}  // namespace detail

/// True when a line of this level would be written. A line is written when its level is not above the level
/// of its channel. While no channel at all is that high, the answer costs one atomic load.
inline bool TraceEnabled(std::string_view inChannel, int inLevel) {
    return inLevel <= detail::gHighestLevel.load(std::memory_order_relaxed) &&
           detail::IsChannelEnabled(inChannel, inLevel);
}
inline bool TraceEnabled(const TraceChannel& inChannel, int inLevel) noexcept {
    return inChannel.IsEnabled(inLevel);
}

/// Writes "<thread> <channel> <level> text" to the sink when the channel is on: one line, secrets blanked.
/// Never throws for the sink's sake, takes no lock across it. Threads: any.
ZOPLATFORM_EXPORT void Trace(std::string_view inChannel, int inLevel, std::string_view inText);
inline void Trace(const TraceChannel& inChannel, int inLevel, std::string_view inText) {
    if (inChannel.IsEnabled(inLevel)) {
        Trace(std::string_view(inChannel.Name()), inLevel, inText);
    }
}

/// Sets the level of a channel and of the channels below it ("ZOCL" is above "ZOCL.Production") that have no
/// level of their own; "*" stands for all. At the start every channel has level 0: fatal notes only.
ZOPLATFORM_EXPORT void SetTraceLevel(std::string_view inChannel, int inLevel);
/// Takes levels from a list of channel:level, parted by commas or line ends ("ZOCL:8,ZOCL.Production:5").
/// Entries that cannot be read are skipped; the number of those is returned.
ZOPLATFORM_EXPORT int SetTraceLevels(std::string_view inList);
/// Forgets all levels and reads anew what the environment (ZOCLIENT_TRACE) and the debug database (key
/// "ostcore.Trace") say; the environment goes over the database. Happens by itself at the first trace.
ZOPLATFORM_EXPORT void ReloadTraceLevels();

/// The trace database: all levels that are set, as text, one channel:level a line.
ZOPLATFORM_EXPORT std::string GetTraceDatabaseAsString();
/// Replaces the levels by those of such a text.
ZOPLATFORM_EXPORT void SetTraceDatabaseFromString(std::string_view inText);

/// Gets a finished line, without its line end, on the thread that traced. Must not trace in turn.
using TraceSink = function<void(const std::string& inLine)>;
/// Puts a sink in the place of standard error and returns the former one; an empty one restores standard
/// error.
ZOPLATFORM_EXPORT TraceSink SetTraceSink(TraceSink inSink);

/// The text with the values of secrets replaced by "[hidden]": login-token, j_password (in forms, JSON,
/// multi-part bodies and pairs), and the header fields Authorization, Proxy-Authorization, Cookie,
/// Set-Cookie.
ZOPLATFORM_EXPORT std::string RedactSecrets(std::string_view inText);

/// Builds the text of an error with structured fields: the message, then ", key: value" for each.
class ZOPLATFORM_EXPORT StructuredText {
public:
    explicit StructuredText(std::string_view inMessage) : mText(inMessage) {}
    StructuredText& Add(std::string_view inKey, std::string_view inValue);
    StructuredText& Add(std::string_view inKey, std::int64_t inValue);
    const std::string& str() const noexcept { return mText; }
    operator std::string_view() const noexcept { return mText; }

private:
    std::string mText;
};

}  // namespace debug
}  // namespace ostcore

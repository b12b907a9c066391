// Everything that zo prints: results on standard output, errors, notes and progress on standard error.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

#include "Failure.h"
#include "Json.h"
#include "Table.h"

namespace zo {

enum class ColorMode { Auto, Always, Never };

/// Texts handed in may come from a hub; what reaches a terminal is made safe by the callers' tables and
/// here. Main thread only.
class Output {
public:
    struct Settings {
        bool json = false;
        bool quiet = false;
        /// Nobody is to be asked.
        bool noInput = false;
        ColorMode color = ColorMode::Auto;
        /// Leads error lines.
        std::string verb;
    };

    Output();
    void Configure(const Settings& inSettings);

    bool IsJson() const noexcept { return mSettings.json; }
    bool IsQuiet() const noexcept { return mSettings.quiet; }
    bool ErrorIsTerminal() const noexcept { return mErrorIsTerminal; }
    /// Whether questions may be asked: standard input and standard error are a terminal.
    bool MayAsk() const noexcept { return mInIsTerminal && mErrorIsTerminal && !mSettings.noInput; }
    /// Whether somebody sits before it who can be told and asked: the same, and neither --json nor --quiet.
    bool HasPerson() const noexcept { return MayAsk() && !mSettings.json && !mSettings.quiet; }

    /// With --json: one line on standard output.
    void Record(const Json& inObject);
    /// For people: a line that was asked for. Nothing with --json.
    void Line(std::string_view inText);
    /// For people: a label and a value, the labels aligned. Nothing with --json.
    void Field(std::string_view inLabel, std::string_view inValue);
    /// For people: what was done, on standard output. Nothing with --json or --quiet.
    void Say(std::string_view inText);
    /// For people: an aside, on standard error. Nothing with --json or --quiet.
    void Note(std::string_view inText);
    /// For people: a table, shortened to the terminal. Nothing with --json.
    void Print(const Table& inTable);
    /// Bytes as they are, on standard output.
    void Raw(std::string_view inBytes);

    void Error(const Failure& inFailure);
    /// How far a longer work is: a bar on a terminal, a line off it, a JSON line with --json. Nothing with
    /// --quiet.
    void Progress(std::string_view inItem, std::uint64_t inDone, std::uint64_t inTotal,
                  std::uint64_t inBytes);
    /// Takes the bar away before other output.
    void EndProgress();

    /// Throws a Failure when something could not be written.
    void Flush();

    std::string Bold(std::string_view inText) const { return Painted(inText, "\033[1m", mColorOut); }

private:
    void WriteOut(std::string_view inBytes);
    void WriteError(std::string_view inBytes);
    static std::string Painted(std::string_view inText, const char* inCode, bool inPaint);
    static std::size_t TerminalWidth(int inDescriptor);

    Settings mSettings;
    bool mInIsTerminal = false;
    bool mOutIsTerminal = false;
    bool mErrorIsTerminal = false;
    bool mColorOut = false;
    bool mColorError = false;
    bool mBarIsShown = false;
    int mWriteError = 0;
};

}  // namespace zo

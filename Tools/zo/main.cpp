// zo, the command line host: reads the arguments, runs one verb, and ends with its exit code.
#include <exception>
#include <string>
#include <vector>

#include "Arguments.h"
#include "Context.h"
#include "Failure.h"
#include "Interrupt.h"
#include "Output.h"

namespace {

zo::ColorMode ColorModeOf(const zo::Arguments& inArguments) {
    const std::string mode = inArguments.ValueOr("color", "auto");
    if (mode == "always") {
        return zo::ColorMode::Always;
    }
    return mode == "never" ? zo::ColorMode::Never : zo::ColorMode::Auto;
}

void Run(const std::vector<std::string>& inWords, zo::Output& ioOutput) {
    zo::Output::Settings settings;
    settings.json = zo::AsksForJson(inWords);
    ioOutput.Configure(settings);
    const zo::Arguments arguments = zo::Arguments::Parse(inWords);
    settings.json = arguments.Has("json");
    settings.quiet = arguments.Has("quiet");
    settings.noInput = arguments.Has("no-input");
    settings.color = ColorModeOf(arguments);
    settings.verb = arguments.GetCommand().name;
    ioOutput.Configure(settings);
    zo::Interrupt interrupt;
    zo::Context context(arguments, ioOutput, interrupt);
    arguments.GetCommand().run(context);
    ioOutput.Flush();
}

}  // namespace

int main(int inCount, char** inValues) {
    zo::Output output;
    try {
        Run(std::vector<std::string>(inValues + 1, inValues + inCount), output);
        return static_cast<int>(zo::ExitCode::Ok);
    } catch (const zo::Failure& failure) {
        output.Error(failure);
        return static_cast<int>(failure.Code());
    } catch (const std::exception& error) {
        output.Error(zo::Failure(zo::ExitCode::Failure, std::string("unexpected failure: ") + error.what(),
                                 "this is a fault of zo; please report it"));
        return static_cast<int>(zo::ExitCode::Failure);
    }
}

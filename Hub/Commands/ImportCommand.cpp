// zohub import: the command around the importer.
#include <unistd.h>

#include <iostream>

#include "Base/Text.h"
#include "Commands/Arguments.h"
#include "Commands/Commands.h"
#include "Commands/Importer.h"

namespace zohub {

namespace {

// On a terminal one line that moves; elsewhere a line now and then.
void ShowProgress(std::size_t inDone, std::size_t inAll) {
    static bool const kIsTerminal = isatty(STDERR_FILENO) != 0;
    std::size_t const step = kIsTerminal ? 50 : 1000;
    if (inDone % step != 0 && inDone != inAll)
        return;
    std::cerr << (kIsTerminal ? "\r" : "") << "zohub: " << inDone << " of " << inAll << " files"
              << (kIsTerminal && inDone != inAll ? "" : "\n") << std::flush;
}

}  // namespace

int RunImport(std::vector<std::string> const& inWords) {
    Arguments const arguments(inWords, {{"--data"},
                                        {"--production"},
                                        {"--owner"},
                                        {"--grant"},
                                        {"--mount"},
                                        {"--max-rendition"},
                                        {"--template", false}});
    ImportRequest request;
    request.directory = arguments.Words(1, "import DIR --production NAME --owner USER [options]")[0];
    request.production = arguments.Need("--production");
    request.owner = arguments.Need("--owner");
    request.grants = arguments.All("--grant");
    request.mount = arguments.Get("--mount");
    request.isTemplate = arguments.Has("--template");
    request.maxRendition = arguments.Number("--max-rendition", request.maxRendition, 512ull << 20);
    if (!IsDisplayName(request.production))
        throw UsageError("a production's name has 1 to 255 bytes of UTF-8 and no control characters");

    auto const storage = OpenSqliteStorage(arguments.DataDirectory());
    ImportReport const report = Import(*storage, request, SystemClock()(), ShowProgress);
    for (auto const& note : report.notes)
        std::cerr << "zohub: left out: " << note << "\n";
    std::cout << "zohub: " << (report.isNewProduction ? "made" : "updated") << " production "
              << report.productionId << " at commit " << report.commitId << ": " << report.added << " added, "
              << report.changed << " changed, " << report.unchanged << " unchanged\n";
    return 0;
}

}  // namespace zohub

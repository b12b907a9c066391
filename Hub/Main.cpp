// zohub: finds the command and turns what it throws into an exit code.
#include <iostream>

#include "Commands/Arguments.h"
#include "Commands/Commands.h"

namespace {

constexpr char kHelp[] = R"(zohub, a collaboration hub for one machine

  zohub serve [--port N] [--tls-port N] [--no-tls] [--listen ADDRESS] [--ready-file FILE]
              [--token-lifetime SECONDS] [--max-connections N] [--max-body BYTES] [--read-threads N]
              [--header-timeout-ms N] [--body-timeout-ms N] [--faults SCRIPT]
  zohub user add NAME --password-file FILE|--password-stdin [--admin] [--replace]
              [--first-name TEXT] [--last-name TEXT] [--email TEXT] [--password-cost 10..16]
  zohub import DIR --production NAME --owner USER [--grant USER]... [--mount LABEL] [--template]
  zohub export DIR --production NAME|ID
  zohub check

Every command takes --data DIR (else ZOHUB_DATA, else XDG_STATE_HOME/zohub) and may run while a server runs
on the same data. Passwords are never taken from the command line.
Exit codes: 0 done, 1 failed or found something wrong, 2 the command line is not understood.
)";

using Command = int (*)(std::vector<std::string> const&);

Command FindCommand(std::vector<std::string>& ioWords) {
    auto const take = [&ioWords](std::size_t inCount) {
        ioWords.erase(ioWords.begin(), ioWords.begin() + static_cast<std::ptrdiff_t>(inCount));
    };
    if (ioWords.size() >= 2 && ioWords[0] == "user" && ioWords[1] == "add") {
        take(2);
        return zohub::RunUserAdd;
    }
    static std::pair<char const*, Command> const kCommands[] = {{"serve", zohub::RunServe},
                                                                {"import", zohub::RunImport},
                                                                {"export", zohub::RunExport},
                                                                {"check", zohub::RunCheck}};
    for (auto const& [name, command] : kCommands) {
        if (!ioWords.empty() && ioWords[0] == name) {
            take(1);
            return command;
        }
    }
    throw zohub::UsageError("no such command; see zohub --help");
}

}  // namespace

int main(int inCount, char** inValues) {
    std::vector<std::string> words(inValues + 1, inValues + inCount);
    if (words.empty() || words[0] == "--help" || words[0] == "-h" || words[0] == "help") {
        std::cout << kHelp;
        return words.empty() ? 2 : 0;
    }
    try {
        return FindCommand(words)(words);
    } catch (zohub::UsageError const& error) {
        std::cerr << "zohub: " << error.what() << "\n";
        return 2;
    } catch (std::exception const& error) {
        std::cerr << "zohub: " << error.what() << "\n";
        return 1;
    }
}

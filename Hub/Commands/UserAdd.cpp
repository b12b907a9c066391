// zohub user add: a new user, whose password comes from a file or from standard input.
#include <fstream>
#include <iostream>

#include "Base/Password.h"
#include "Base/Text.h"
#include "Commands/Arguments.h"
#include "Commands/Commands.h"
#include "Store/Storage.h"

namespace zohub {

namespace {

std::string ReadPassword(Arguments const& inArguments) {
    if (inArguments.Has("--password-stdin") == inArguments.Has("--password-file"))
        throw UsageError("give the password by one of --password-file FILE and --password-stdin");
    std::string password;
    if (inArguments.Has("--password-stdin")) {
        std::getline(std::cin, password);
    } else {
        std::ifstream file(inArguments.Need("--password-file"));
        if (!file)
            throw std::runtime_error("cannot read the password file " + inArguments.Get("--password-file"));
        std::getline(file, password);
    }
    if (!password.empty() && password.back() == '\r')
        password.pop_back();
    if (password.empty() || password.size() > 1024)
        throw std::runtime_error("the password must have 1 to 1024 bytes, on one line");
    return password;
}

}  // namespace

int RunUserAdd(std::vector<std::string> const& inWords) {
    Arguments const arguments(inWords, {{"--data"},
                                        {"--password-file"},
                                        {"--password-stdin", false},
                                        {"--password-cost"},
                                        {"--first-name"},
                                        {"--last-name"},
                                        {"--email"},
                                        {"--admin", false},
                                        {"--replace", false}});
    UserRecord user;
    user.name = arguments.Words(1, "user add NAME --password-file FILE|--password-stdin [options]")[0];
    user.firstName = arguments.Get("--first-name");
    user.lastName = arguments.Get("--last-name");
    user.email = arguments.Get("--email");
    user.isAdmin = arguments.Has("--admin");
    user.created = SystemClock()();
    if (!IsDisplayName(user.name))
        throw UsageError("a user name has 1 to 255 bytes of UTF-8 and no control characters");
    for (auto const* text : {&user.firstName, &user.lastName, &user.email})
        if (!text->empty() && !IsDisplayName(*text))
            throw UsageError("names and the address must be UTF-8 without control characters");
    auto const cost = arguments.Number("--password-cost", kUsualPasswordCost, kLargestPasswordCost);
    if (cost < kSmallestPasswordCost)
        throw UsageError("--password-cost takes a number from " + std::to_string(kSmallestPasswordCost) +
                         " to " + std::to_string(kLargestPasswordCost));
    user.passwordHash = HashPassword(ReadPassword(arguments), static_cast<unsigned>(cost));

    auto const storage = OpenSqliteStorage(arguments.DataDirectory());
    auto const transaction = storage->BeginWrite();
    if (transaction->FindUser(user.name) && !arguments.Has("--replace"))
        throw std::runtime_error("the user " + user.name + " exists already; add --replace to change him");
    transaction->PutUser(user);
    transaction->Commit();
    std::cout << "zohub: user " << user.name << " added\n";
    return 0;
}

}  // namespace zohub

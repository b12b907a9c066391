// Steps of the work in sessions and transactions, for the tests that need them.
#pragma once

#include "HubFixture.h"

namespace zohub::test {

class SessionTest : public HubTest {
protected:
    /// A production of anna's that ben may work on as well.
    Json MakeSharedProduction();

    /// A fresh session on the production.
    static Json MakeSession(Client const& inClient, Json const& inProduction);
    static Json Load(Client const& inClient, Json const& inDocument);

    /// On the session's present head unless a commit is named.
    static Json MakeTransaction(Client const& inClient, Json const& inSession,
                                std::string const& inCommit = {});
    static Answer TryCommit(Client const& inClient, Json const& inTransaction,
                            std::string const& inStrategy = "NONE", std::string const& inMessage = "work");
    /// The session after the commit.
    static Json Commit(Client const& inClient, Json const& inTransaction,
                       std::string const& inStrategy = "NONE", std::string const& inMessage = "work");

    /// An asset of that identifier, in a transaction or production.
    static Json AddAsset(Client const& inClient, Json const& inLine, std::string const& inId,
                         std::string const& inName);
    static void Rename(Client const& inClient, Json const& inLine, std::string const& inId,
                       std::string const& inName);
    /// In a transaction of its own; gives the session afterwards.
    static Json AddInSession(Client const& inClient, Json const& inSession, std::string const& inId,
                             std::string const& inName);
    static Json RenameInSession(Client const& inClient, Json const& inSession, std::string const& inId,
                                std::string const& inName);

    /// The fields that are not empty are sent.
    static Answer Push(Client const& inClient, Json const& inSession, std::string const& inMessage,
                       std::string const& inCommit = {}, std::string const& inStrategy = "NONE",
                       Client::Headers const& inHeaders = {});
    static Answer Pull(Client const& inClient, Json const& inSession, std::string const& inStrategy = {},
                       std::string const& inCommit = {}, Client::Headers const& inHeaders = {});

    /// The names of the assets by identifier.
    static std::map<std::string, std::string> Names(Client const& inClient, Json const& inLine);
    /// The titles of the history, newest first.
    static std::vector<std::string> Titles(Client const& inClient, Json const& inLine);

    /// What zohub check finds.
    std::vector<std::string> Problems();
};

std::string CommitOf(Json const& inLine);
std::string ErrorCode(Answer const& inAnswer);

}  // namespace zohub::test

// The exit codes that scripts rely on, and which result becomes which.
#include <gtest/gtest.h>

#include "Failure.h"

namespace zo {
namespace {

boost::shared_ptr<ostnet::Response> Status(int inStatus) {
    return boost::make_shared<ostnet::Response>(inStatus);
}

boost::shared_ptr<ostnet::Response> TransportError(int inError) {
    const auto response = boost::make_shared<ostnet::Response>(0);
    response->curlError = inError;
    return response;
}

TEST(ExitCodes, AreFrozen) {
    const std::vector<std::pair<int, std::string>> frozen{{0, "ok"},
                                                          {1, "failure"},
                                                          {2, "usage"},
                                                          {3, "conflicts-remain"},
                                                          {4, "behind"},
                                                          {5, "session-changed"},
                                                          {6, "not-authenticated"},
                                                          {7, "not-permitted"},
                                                          {8, "not-found"},
                                                          {9, "network"},
                                                          {10, "tls"},
                                                          {11, "partly-done"},
                                                          {130, "cancelled"}};
    std::vector<std::pair<int, std::string>> actual;
    for (const ExitCodeText& row : AllExitCodes()) {
        actual.emplace_back(static_cast<int>(row.code), row.name);
    }
    EXPECT_EQ(actual, frozen);
}

TEST(ExitCodes, ComeFromStatusesOfTheHub) {
    const std::vector<std::pair<int, ExitCode>> table{{200, ExitCode::Ok},
                                                      {201, ExitCode::Ok},
                                                      {401, ExitCode::NotAuthenticated},
                                                      {403, ExitCode::NotPermitted},
                                                      {404, ExitCode::NotFound},
                                                      {410, ExitCode::NotFound},
                                                      {409, ExitCode::Behind},
                                                      {412, ExitCode::SessionChanged},
                                                      {408, ExitCode::Network},
                                                      {429, ExitCode::Network},
                                                      {502, ExitCode::Network},
                                                      {503, ExitCode::Network},
                                                      {504, ExitCode::Network},
                                                      {500, ExitCode::Failure},
                                                      {400, ExitCode::Failure},
                                                      {302, ExitCode::Failure},
                                                      {418, ExitCode::Failure}};
    for (const auto& [status, code] : table) {
        const auto response = Status(status);
        EXPECT_EQ(ExitCodeFor(ZOCL::GetResultFromResponse(response, ZOCL::kResultFailure), response), code)
            << status;
    }
    // The result alone is enough where it carries the status.
    EXPECT_EQ(ExitCodeFor(ZOCL::kResultHTTPForbidden, nullptr), ExitCode::NotPermitted);
}

TEST(ExitCodes, ComeFromTheTransport) {
    const auto of = [](int inError) {
        const auto response = TransportError(inError);
        return ExitCodeFor(ZOCL::GetResultFromResponse(response, ZOCL::kResultFailure), response);
    };
    EXPECT_EQ(of(6), ExitCode::Network);   // the host's name is not known
    EXPECT_EQ(of(7), ExitCode::Network);   // connection refused
    EXPECT_EQ(of(28), ExitCode::Network);  // timed out
    EXPECT_EQ(of(56), ExitCode::Network);  // reset
    EXPECT_EQ(of(60), ExitCode::Tls);      // certificate not trusted
    EXPECT_EQ(of(35), ExitCode::Tls);      // handshake failed
    EXPECT_EQ(of(77), ExitCode::Tls);      // authority file unreadable
    EXPECT_EQ(of(63), ExitCode::Failure);  // body larger than allowed: trying again will not help
}

TEST(ExitCodes, EveryWayOfCancellingIsOne) {
    for (const int result : {ZOCL::kResultCancelled, ZOCL::kResultRequestCancelled,
                             ZOCL::kResultDialogCancelled, ZOCL::kResultDialogAlternativeCancelled}) {
        EXPECT_EQ(ExitCodeFor(result, nullptr), ExitCode::Cancelled);
    }
    EXPECT_EQ(ExitCodeFor(ZOCL::kResultRequestCancelled, Status(-1)), ExitCode::Cancelled);
    EXPECT_EQ(ExitCodeFor(ZOCL::kResultNotStarted, nullptr), ExitCode::Failure);
    EXPECT_EQ(ExitCodeFor(ZOCL::kResultNoResponseObject, nullptr), ExitCode::Failure);
}

TEST(Failure, TellsWhatWasTriedWhyAndWhatNext) {
    const Failure failure = Failure::OfRequest("loading X", ZOCL::kResultHTTPNotFound, Status(404));
    EXPECT_EQ(failure.Code(), ExitCode::NotFound);
    EXPECT_EQ(failure.Status(), 404);
    EXPECT_EQ(failure.ResultName(), "http-404");
    EXPECT_EQ(std::string(failure.what()).find("loading X: "), 0u);
    EXPECT_FALSE(failure.Hint().empty());
    // A status that has no result of its own is named all the same.
    EXPECT_NE(std::string(Failure::OfRequest("x", ZOCL::kResultFailure, Status(418)).what()).find("418"),
              std::string::npos);
}

}  // namespace
}  // namespace zo

// Result codes out of responses, names and meanings, all from the one table.
#include "ZOClient/ResultCodes.h"

#include "ostnet/HeaderConstants.h"

namespace ZOCL {

namespace {

struct Row {
    std::uint32_t code;
    const char* name;
    const char* meaning;
};

#define ZOCL_RESULT_ROW(constant, code, name, meaning) {code, name, meaning},
constexpr Row kRows[] = {ZOCL_RESULT_TABLE(ZOCL_RESULT_ROW)};
#undef ZOCL_RESULT_ROW

constexpr std::uint32_t kHTTPSuccessFamily = 0x20450000u;
constexpr std::uint32_t kHTTPFailureFamily = 0xA0450000u;

bool IsInTable(std::uint32_t inCode) {
    for (const Row& row : kRows) {
        if (row.code == inCode) {
            return true;
        }
    }
    return false;
}

const Row* FindRow(int inResult) {
    for (const Row& row : kRows) {
        if (static_cast<int>(row.code) == inResult) {
            return &row;
        }
    }
    return nullptr;
}

int GetResultFromStatus(std::int32_t inStatus) {
    switch (inStatus) {
        case ostnet::Response::kStatusCancelled:
            return kResultRequestCancelled;
        case ostnet::Response::kStatusNoResponse:
            return kResultNoHTTPResponse;
        case 200:
            return kResultSuccess;
        default:
            break;
    }
    // The numbers below 100 of the failure family are outcomes of our own and no statuses.
    if (inStatus < 200 || inStatus > 0xFFFF) {
        return kResultFailure;
    }
    const std::uint32_t family = inStatus < 300 ? kHTTPSuccessFamily : kHTTPFailureFamily;
    const std::uint32_t code = family | static_cast<std::uint32_t>(inStatus);
    return IsInTable(code) ? static_cast<int>(code) : kResultFailure;
}

}  // namespace

int GetResultFromResponse(const shared_ptr<ostnet::Response>& inResponse, int inDefaultResult) {
    return inResponse ? GetResultFromStatus(inResponse->status) : inDefaultResult;
}

ImmutableString GetETagFromResponse(const shared_ptr<ostnet::Response>& inResponse) {
    if (!inResponse || !inResponse->IsSuccess()) {
        return ImmutableString();
    }
    return ostnet::GetHeader(inResponse->headers, ostnet::kHEADER_ETAG);
}

bool ResultSucceededOrCanceled(int inResult) {
    return inResult >= 0 || inResult == kResultCancelled || inResult == kResultRequestCancelled ||
           inResult == kResultDialogCancelled || inResult == kResultDialogAlternativeCancelled;
}

bool LoadResultSucceeded(int inResult) {
    return inResult == kResultSuccess || inResult == kResultHTTPOK ||
           inResult == kResultHTTPNotModifiedSuccess;
}

const char* GetResultName(int inResult) {
    const Row* row = FindRow(inResult);
    return row ? row->name : "unknown";
}

const char* GetResultMeaning(int inResult) {
    const Row* row = FindRow(inResult);
    return row ? row->meaning : "a code outside the table of results";
}

}  // namespace ZOCL

// The result codes of the library: one table from which the constants, the names that tools print and the
// documentation come.
#pragma once

#include "ZOClient/Export.h"
#include "ZOClient/Types.h"

// X(constant, code, name that tools print, meaning)
// Negative (top bit set) is failure. The families 0x2045 and 0xA045 carry an HTTP status in the low 16 bits.
#define ZOCL_RESULT_TABLE(X)                                                                                \
    X(kResultSuccess, 0x00000000u, "ok", "success; also HTTP 200")                                          \
    X(kResultGone, 0x20450003u, "gone", "success: what was to be deleted or read is not there")             \
    X(kResultHTTPOK, 0x204500C8u, "http-200", "HTTP 200 in the success family; accepted, never produced")   \
    X(kResultHTTPCreated, 0x204500C9u, "http-201", "HTTP 201, created")                                     \
    X(kResultHTTPAccepted, 0x204500CAu, "http-202", "HTTP 202, accepted")                                   \
    X(kResultHTTPNonAuthoritative, 0x204500CBu, "http-203", "HTTP 203, non-authoritative information")      \
    X(kResultHTTPNoContent, 0x204500CCu, "http-204", "HTTP 204, no content")                                \
    X(kResultHTTPResetContent, 0x204500CDu, "http-205", "HTTP 205, reset content")                          \
    X(kResultHTTPPartialContent, 0x204500CEu, "http-206", "HTTP 206, partial content")                      \
    X(kResultHTTPNotModifiedSuccess, 0x20450130u, "http-304-success",                                       \
      "success form of HTTP 304; accepted, never produced")                                                 \
    X(kResultContentAvailable, 0x20330001u, "content-available", "the content is available at once")        \
    X(kResultContentPending, 0x20330002u, "content-pending", "the content comes through the completion")    \
    X(kResultEnclosureCreated, 0x20410002u, "enclosure-created", "the server created the enclosure")        \
    X(kResultEnclosureFailed, 0xA0410001u, "enclosure-failed", "the server did not accept the enclosure")   \
    X(kResultInterfaceNotSupported, 0xA00A0001u, "no-interface", "the object has no such interface")        \
    X(kResultFailure, 0xA00F0001u, "failure", "generic failure, or an HTTP status outside this table")      \
    X(kResultNoSuchKey, 0xA00F0003u, "no-such-key", "the registry key or value does not exist")             \
    X(kResultInvalidState, 0xA00F0004u, "invalid-state", "invalid state of a production operation")         \
    X(kResultCancelled, 0xA00F0007u, "cancelled", "the operation was cancelled")                            \
    X(kResultRequestCancelled, 0xA0450001u, "request-cancelled", "the request was cancelled")               \
    X(kResultNoHTTPResponse, 0xA0450003u, "no-response", "no HTTP response came")                           \
    X(kResultNoResponseObject, 0xA0450004u, "no-response-object", "there is no response to judge by")       \
    X(kResultNotStarted, 0xA0450005u, "not-started", "the request could not be started")                    \
    X(kResultDialogCancelled, 0xA0450006u, "dialog-cancelled", "the user dismissed a dialog with cancel")   \
    X(kResultDialogAlternativeCancelled, 0xA0450007u, "dialog-alternative-cancelled",                       \
      "the user dismissed a dialog with its alternative cancel")                                            \
    X(kResultAlreadyThere, 0xA0450008u, "already-there", "the resource is already at the wanted state")     \
    X(kResultNotPossible, 0xA0450009u, "not-possible",                                                      \
      "preparation found that the operation isn't possible")                                                \
    X(kResultHTTPMultipleChoices, 0xA045012Cu, "http-300", "HTTP 300, multiple choices")                    \
    X(kResultHTTPMovedPermanently, 0xA045012Du, "http-301", "HTTP 301, moved permanently")                  \
    X(kResultHTTPFound, 0xA045012Eu, "http-302", "HTTP 302, found")                                         \
    X(kResultHTTPSeeOther, 0xA045012Fu, "http-303", "HTTP 303, see other")                                  \
    X(kResultHTTPNotModified, 0xA0450130u, "http-304", "HTTP 304, not modified; failure form")              \
    X(kResultHTTPUseProxy, 0xA0450131u, "http-305", "HTTP 305, use proxy")                                  \
    X(kResultHTTPTemporaryRedirect, 0xA0450133u, "http-307", "HTTP 307, temporary redirect")                \
    X(kResultHTTPBadRequest, 0xA0450190u, "http-400", "HTTP 400, bad request")                              \
    X(kResultHTTPUnauthorized, 0xA0450191u, "http-401", "HTTP 401, not authenticated")                      \
    X(kResultHTTPPaymentRequired, 0xA0450192u, "http-402", "HTTP 402, payment required")                    \
    X(kResultHTTPForbidden, 0xA0450193u, "http-403", "HTTP 403, not permitted")                             \
    X(kResultHTTPNotFound, 0xA0450194u, "http-404", "HTTP 404, not found")                                  \
    X(kResultHTTPMethodNotAllowed, 0xA0450195u, "http-405", "HTTP 405, method not allowed")                 \
    X(kResultHTTPNotAcceptable, 0xA0450196u, "http-406", "HTTP 406, not acceptable")                        \
    X(kResultHTTPProxyAuthentication, 0xA0450197u, "http-407", "HTTP 407, proxy authentication required")   \
    X(kResultHTTPRequestTimeout, 0xA0450198u, "http-408", "HTTP 408, request time-out")                     \
    X(kResultHTTPConflict, 0xA0450199u, "http-409", "HTTP 409, conflict: a newer commit exists")            \
    X(kResultHTTPGone, 0xA045019Au, "http-410", "HTTP 410, gone")                                           \
    X(kResultHTTPLengthRequired, 0xA045019Bu, "http-411", "HTTP 411, length required")                      \
    X(kResultHTTPPreconditionFailed, 0xA045019Cu, "http-412", "HTTP 412, changed behind the client's back") \
    X(kResultHTTPPayloadTooLarge, 0xA045019Du, "http-413", "HTTP 413, payload too large")                   \
    X(kResultHTTPURITooLong, 0xA045019Eu, "http-414", "HTTP 414, URI too long")                             \
    X(kResultHTTPUnsupportedMediaType, 0xA045019Fu, "http-415", "HTTP 415, unsupported media type")         \
    X(kResultHTTPRangeNotSatisfiable, 0xA04501A0u, "http-416", "HTTP 416, range not satisfiable")           \
    X(kResultHTTPExpectationFailed, 0xA04501A1u, "http-417", "HTTP 417, a stored body does not inflate")    \
    X(kResultHTTPInternalServerError, 0xA04501F4u, "http-500", "HTTP 500, internal server error")           \
    X(kResultHTTPNotImplemented, 0xA04501F5u, "http-501", "HTTP 501, method unknown to the server")         \
    X(kResultHTTPBadGateway, 0xA04501F6u, "http-502", "HTTP 502, bad gateway")                              \
    X(kResultHTTPServiceUnavailable, 0xA04501F7u, "http-503", "HTTP 503, service unavailable")              \
    X(kResultHTTPGatewayTimeout, 0xA04501F8u, "http-504", "HTTP 504, gateway time-out")                     \
    X(kResultHTTPVersionNotSupported, 0xA04501F9u, "http-505", "HTTP 505, HTTP version not supported")

namespace ZOCL {

#define ZOCL_RESULT_CONSTANT(constant, code, name, meaning) constexpr int constant = static_cast<int>(code);
ZOCL_RESULT_TABLE(ZOCL_RESULT_CONSTANT)
#undef ZOCL_RESULT_CONSTANT

/// The result for a response: inDefaultResult without a response, else the code of its status, and
/// kResultFailure for a status outside the table. Pure; any thread.
ZOCL_EXPORT int GetResultFromResponse(const shared_ptr<ostnet::Response>& inResponse, int inDefaultResult);
/// The ETag header of a response with status 200 to 299, else the null string.
ZOCL_EXPORT ImmutableString GetETagFromResponse(const shared_ptr<ostnet::Response>& inResponse);
/// True for every success and for the four ways of cancelling.
ZOCL_EXPORT bool ResultSucceededOrCanceled(int inResult);
/// True only for the three codes of a finished load; HTTP 201 to 206 are not among them.
ZOCL_EXPORT bool LoadResultSucceeded(int inResult);
/// The short stable name that tools print, "unknown" for a code outside the table. Static storage.
ZOCL_EXPORT const char* GetResultName(int inResult);
/// One sentence on what the code means. Static storage.
ZOCL_EXPORT const char* GetResultMeaning(int inResult);

}  // namespace ZOCL

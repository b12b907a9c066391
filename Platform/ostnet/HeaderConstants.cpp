#include "ostnet/HeaderConstants.h"

namespace ostnet {

const ImmutableString kHEADER_ETAG("ETag");
const ImmutableString kHEADER_LOCATION("Location");
const ImmutableString kHEADER_CONTENT_TYPE("Content-Type");
const ImmutableString kHEADER_CONTENT_ENCODING("Content-Encoding");
const ImmutableString kHEADER_COOKIE("Cookie");
const ImmutableString kHEADER_SET_COOKIE("Set-Cookie");
const ImmutableString kHEADER_EXPECT("Expect");
const ImmutableString kHEADER_IF_MATCH("If-Match");
const ImmutableString kHEADER_IF_NONE_MATCH("If-None-Match");
const ImmutableString kHEADER_CACHECONTROL("Cache-Control");
const ImmutableString kHEADER_IDEMPOTENCY_KEY("Idempotency-Key");
const ImmutableString kHEADER_CONTENT_TYPE_APPLICATION_JSON("application/json");
const ImmutableString kHEADER_CONTENT_TYPE_APPLICATION_JSON_UTF_8("application/json;charset=utf-8");
const ImmutableString kHEADER_CONTENT_TYPE_TEXT_PLAIN("text/plain");
const ImmutableString kHEADERVALUE_NOCACHE("no-cache");
const ImmutableString kHEADERVALUE_102_PROCESSING("102-processing");

}  // namespace ostnet

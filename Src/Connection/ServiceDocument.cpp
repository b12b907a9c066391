// Reading the service documents.
#include "Connection/ServiceDocument.h"

#include "ostcore/debug/Trace.h"

namespace ZOCL {

using ostcore::serialization::JSONValue;
using ostcore::serialization::JSONView;

namespace {

ImmutableString ReadText(JSONView inObject, std::string_view inKey) {
    const JSONView value = inObject.Find(inKey);
    return value.IsNull() ? ImmutableString() : value.AsInternedString();
}

std::uint32_t ReadNumber(JSONView inObject, std::string_view inKey, std::uint32_t inDefault) {
    const JSONView value = inObject.Find(inKey);
    return value.IsNull() ? inDefault : value.AsUInt32();
}

ServiceDocument::Description ReadDescription(JSONView inServer) {
    ServiceDocument::Description result;
    result.id = ReadText(inServer, "id");
    result.name = ReadText(inServer, "name");
    result.description = ReadText(inServer, "description");
    result.version = ReadText(inServer, "version");
    const JSONView configuration = inServer.Find("configuration");
    result.syslogAddress = ReadText(configuration, "syslog.ip");
    result.syslogPort = ReadNumber(configuration, "syslog.port", result.syslogPort);
    configuration.Find("renderProtocolVersions").ForEachElement([&](JSONView inVersion) {
        result.renderProtocolVersions.push_back(inVersion.AsUInt32());
    });
    return result;
}

ServiceDocument ReadDocument(const JSONValue& inRoot) {
    const JSONView root(inRoot);
    if (!root.IsObject()) {
        ostcore::serialization::ThrowWrongJSONType();
    }
    ServiceDocument document;
    document.server = ReadDescription(root.Find("server"));
    const JSONView properties = root.Find("properties");
    if (!properties.IsNull()) {
        document.majorVersion = ReadNumber(properties, "majorVersion", 1);
        document.minorVersion = ReadNumber(properties, "minorVersion", 0);
    }
    document.links = ReadLinks(inRoot);
    return document;
}

void TraceRefusal(const char* inReason) {
    if (ostcore::debug::TraceEnabled("ZOCL", ostcore::debug::kTraceLevel_Error)) {
        ostcore::debug::Trace(
            "ZOCL", ostcore::debug::kTraceLevel_Error,
            ostcore::debug::StructuredText("The server's service document cannot be read; check "
                                           "that the address is that of a collaboration hub")
                .Add("reason", inReason));
    }
}

}  // namespace

bool ParseServiceDocument(const shared_ptr<RecycledMemory const>& inPayload, ServiceDocument& outDocument) {
    if (!inPayload) {
        TraceRefusal("the answer has no body");
        return false;
    }
    try {
        outDocument = ReadDocument(ostcore::serialization::JSONParse(inPayload));
        return true;
    } catch (const std::exception& failure) {
        TraceRefusal(failure.what());
        return false;
    }
}

}  // namespace ZOCL

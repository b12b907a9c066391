// Objects of the model made from bodies, without a request.
#pragma once

#include "ClientTest.h"
#include "Model/ResourceCreation.h"
#include "Relations.h"

namespace ZOCL {

/// A link as JSON (in the notation of Quote); the relation is one with a path.
inline std::string LinkTo(const ImmutableString& inRelation, const std::string& inPath) {
    return "{'rel':'" + inRelation.str() + "','href':'" + HubURL(inPath).str() + "'}";
}

class ModelTest : public ClientTest {
protected:
    using ClientTest::ClientTest;

    /// Loaded from a body that came with an answer.
    template <class T>
    InterfaceRef<T> Make(const std::string& inBody, const std::string& inTag = "\"t1\"",
                         ResourceWritability inWritability = ResourceWritability::kWritable) {
        const InterfaceRef<T> made(new T);
        const auto response = make_shared<ostnet::Response>(200);
        response->headers.emplace(ImmutableString("Content-Type"), ImmutableString("application/json"));
        if (!inTag.empty()) {
            response->headers.emplace(ImmutableString("ETag"), ImmutableString(inTag));
        }
        response->payload = Bytes(Quote(inBody));
        EXPECT_TRUE(made->InternalInit(HubURL("/object"), server, response, inWritability, true)) << inBody;
        return made;
    }
    std::size_t Requests() const { return net->RequestCount(); }
};

}  // namespace ZOCL

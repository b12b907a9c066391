// Bodies that a broken or hostile server sends in lists: each ends as an unloaded resource or with a defined
// meaning, and none as an exception.
#include <random>

#include "ClientTest.h"
#include "dto/Asset.h"
#include "dto/MediaLocator.h"
#include "dto/Production.h"
#include "dto/User.h"
#include "JSONServerResource.h"

namespace ZOCL {
namespace {

const char* const kAssetList =
    "{'assets':[{'zo:assetId':'a1','zo:etag':'e','zo:assetContentId':'c','properties':{'name':'n',"
    "'description':'d','mediaLocator':'m','zo:parent':'p','tags':['t','u'],'subClip':{'mStartBoundary':"
    "{'ticks':-5},'mEndBoundary':{'ticks':9223372036854775807},'mBoundaryIsHard':false},'cdzo:assetType':'"
    "bin',"
    "'isMulticamEnabled':true,'zeroPoint':{'ticks':1},'smartBinQuery':'q','unknown':[1,{}]},"
    "'links':[{'rel':'self','href':'http://x/1','type':'t','title':'t','zo:etag':'e'}],"
    "'enclosures':{'enclosures':[{'name':'x','zo:enclosureId':'i'}],'links':[]},"
    "'renditions':{'renditions':[{'zo:renditionId':'r','properties':{'zo:mimeType':'image/png'}}]}}],"
    "'stats':{'x':1},'links':[{'rel':'create','href':'http://x/c'}]}";
const char* const kProductionList =
    "{'links':[],'stats':[],'productions':[{'zo:productionId':'p','owner':'o','created':"
    "'2026-01-01T00:00:00Z','metadata':{'machineIP':'1'},'properties':{'name':'n','tags':['t']},'hasBin':"
    "true}],"
    "'sessions':[{'zo:sessionId':'s'}],'transactions':[{'zo:transactionId':'t'}]}";

class HostileBodyTest : public ClientTest {
protected:
    /// Whether a body loads; fails the test when anything is thrown or the state does not fit.
    template <class T>
    bool Loads(std::string_view inBody) {
        const InterfaceRef<JSONServerResource<T>> resource(new JSONServerResource<T>);
        const auto response = make_shared<ostnet::Response>(200);
        response->headers.emplace(ImmutableString("Content-Type"), ImmutableString("application/json"));
        response->payload = Bytes(inBody);
        bool loaded = false;
        EXPECT_NO_THROW(loaded = resource->InternalInit(HubURL("/l"), server, response,
                                                        ResourceWritability::kReadOnly, false));
        EXPECT_EQ(loaded, resource->IsLoaded());
        return loaded;
    }
    template <class T>
    void CutEverywhere(const std::string& inBody) {
        ASSERT_TRUE(Loads<T>(inBody));
        for (std::size_t size = 1; size < inBody.size(); ++size) {
            ASSERT_FALSE(Loads<T>(std::string_view(inBody).substr(0, size))) << "cut at " << size;
        }
    }
};

TEST_F(HostileBodyTest, EveryCutIsAnError) {
    ostcore::debug::SetTraceLevel("*", 0);
    CutEverywhere<dto::ContainedAssets>(Quote(kAssetList));
    CutEverywhere<dto::Productions>(Quote(kProductionList));
}

TEST_F(HostileBodyTest, EveryWrongTypeFailsTheList) {
    ostcore::debug::SetTraceLevel("*", 0);
    const std::string assets = Quote(kAssetList);
    const std::vector<std::pair<std::string, std::string>> changes = {
        {"'a1'", "1"},
        {"'zo:etag':'e'", "'zo:etag':{}"},
        {"'name':'n'", "'name':null"},
        {"'cdzo:assetType':'bin'", "'cdzo:assetType':[]"},
        {"['t','u']", "['t',1]"},
        {"['t','u']", "'t'"},
        {"'mBoundaryIsHard':false", "'mBoundaryIsHard':'false'"},
        {"{'ticks':-5}", "-5"},
        {"{'ticks':-5}", "{'ticks':'5'}"},
        {"{'ticks':1}", "{'ticks':1.5}"},
        {"9223372036854775807", "9223372036854775808"},
        {"'isMulticamEnabled':true", "'isMulticamEnabled':1"},
        {"'href':'http://x/1'", "'href':5"},
        {"'links':[{'rel':'self'", "'links':[7,{'rel':'self'"},
        {"{'enclosures':[{", "{'enclosures':[[],{"},
        {"'name':'x'", "'name':false"},
        {"'zo:renditionId':'r'", "'zo:renditionId':0"},
        {"'zo:mimeType':'image/png'", "'zo:mimeType':{}"},
        {"{'assets':[", "{'assets':{},'x':["},
    };
    for (const auto& change : changes) {
        std::string body = assets;
        const std::string from = Quote(change.first);
        ASSERT_NE(body.find(from), std::string::npos) << from;
        body.replace(body.find(from), from.size(), Quote(change.second));
        EXPECT_FALSE(Loads<dto::ContainedAssets>(body)) << change.second;
    }
    for (const char* root : {"[]", "\"x\"", "7", "true", "null"}) {
        EXPECT_FALSE(Loads<dto::ContainedAssets>(root)) << root;
        EXPECT_FALSE(Loads<dto::Productions>(root)) << root;
    }
}

TEST_F(HostileBodyTest, AbsentValuesNeverFail) {
    EXPECT_TRUE(Loads<dto::ContainedAssets>(Quote("{'assets':[{},{'properties':{},'enclosures':null}]}")));
    EXPECT_TRUE(Loads<dto::Productions>(Quote("{'sessions':[{}]}")));
    EXPECT_TRUE(
        Loads<dto::MediaLocator>(Quote("{'properties':{'stillSequenceParams':null,"
                                       "'numberedStills':null}}")));
    EXPECT_TRUE(Loads<dto::UserBlock>("{}"));
}

TEST_F(HostileBodyTest, SyntaxAndSizeHaveDefinedEnds) {
    const std::string deep = std::string(100000, '[');
    const std::string deepObjects = [] {
        std::string text;
        for (int i = 0; i < 100000; ++i) {
            text += "{\"a\":";
        }
        return text;
    }();
    struct Row {
        std::string body;
        bool loads;
    };
    const Row rows[] = {
        {deep, false},
        {deepObjects, false},
        {"{\"assets\":" + deep + std::string(100000, ']') + "}", false},
        {"{\"x\":1e999}", false},
        {"{\"x\":123456789012345678901234567890}", false},
        {"{\"x\":\"\xff\xfe\"}", false},
        {"{\"x\":\"\xed\xa0\x80\"}", false},
        {"{\"x\":\"\\ud800\"}", false},
        {"{\"x\":\"a\\u0000b\"}", true},
        {std::string("{\"x\":\"a\0b\"}", 11), false},
        {"{} {}", false},
        {"{\"x\":1,}", false},
        {"\xef\xbb\xbf{}", true},
        {"{\"assets\":[],\"assets\":[{\"zo:assetId\":\"last\"}]}", true},
        {"<html>", false},
        {" ", false},
    };
    for (const Row& row : rows) {
        EXPECT_EQ(Loads<dto::ContainedAssets>(row.body), row.loads) << row.body.substr(0, 60);
    }
}

TEST_F(HostileBodyTest, LastOfEqualKeysCounts) {
    const auto list = dto::ContainedAssets::FromJSON(
        Quote("{'assets':[{'zo:assetId':'no'}],'assets':[{'zo:assetId':'first','zo:assetId':'last'}]}"));
    ASSERT_EQ(list.Assets().size(), 1u);
    EXPECT_EQ(list.Assets()[0].Identifier().view(), "last");
}

TEST_F(HostileBodyTest, RandomDamageNeverEscapes) {
    ostcore::debug::SetTraceLevel("*", 0);
    const std::string whole = Quote(kAssetList);
    const unsigned seed = 20261124;
    std::mt19937 random(seed);
    SCOPED_TRACE("seed " + std::to_string(seed));
    for (int round = 0; round < 3000; ++round) {
        std::string body = whole;
        for (int i = 0; i < 3; ++i) {
            body[random() % body.size()] = static_cast<char>(random() % 256);
        }
        Loads<dto::ContainedAssets>(body);
    }
}

}  // namespace
}  // namespace ZOCL

// A transaction that takes changes in bulk, and a server that answers its forms.
#pragma once

#include <future>

#include "SessionTest.h"
#include "ZOClient/CompoundAsyncOperation.h"
#include "ZOClient/IZOCBulkTransaction.h"

namespace ZOCL {

struct FormPart {
    std::string name;
    std::string type;
    std::string body;
};
using FormParts = std::vector<FormPart>;

constexpr const char* kJSONType = "application/json;charset=utf-8";
constexpr const char* kTextType = "text/plain";

inline std::string BoundaryOf(const RecordedRequest& inRequest) {
    const std::string type = inRequest.Header("Content-Type");
    const std::string begin = "multipart/form-data; boundary=";
    return type.rfind(begin, 0) == 0 ? type.substr(begin.size()) : std::string();
}

/// The very bytes of a form.
inline std::string FormText(const std::string& inBoundary, const FormParts& inParts) {
    std::string text;
    for (const FormPart& part : inParts) {
        text += "--" + inBoundary + "\r\nContent-Disposition: form-data; name=\"" + part.name +
                "\"\r\nContent-Type: " + part.type + "\r\n\r\n" + part.body + "\r\n";
    }
    return text + "--" + inBoundary + "--\r\n";
}

/// The parts of a form, read back; bodies of forms in these tests do not hold the boundary.
inline FormParts PartsOf(const RecordedRequest& inRequest) {
    FormParts parts;
    const std::string mark = "--" + BoundaryOf(inRequest) + "\r\n";
    const std::string& text = inRequest.body;
    const auto between = [&text](const std::string& inBegin, const std::string& inEnd, std::size_t& ioAt) {
        const std::size_t begin = text.find(inBegin, ioAt) + inBegin.size();
        ioAt = text.find(inEnd, begin);
        return text.substr(begin, ioAt - begin);
    };
    for (std::size_t at = text.find(mark); at != std::string::npos; at = text.find(mark, at)) {
        FormPart part;
        part.name = between("name=\"", "\"\r\n", at);
        part.type = between("Content-Type: ", "\r\n\r\n", at);
        part.body = between("\r\n\r\n", "\r\n--" + BoundaryOf(inRequest), at);
        parts.push_back(part);
    }
    return parts;
}

/// How often a completion was called, and with what.
class Calls {
public:
    IZOCBulkTransaction::ResultCompletion Result() const {
        const auto state = mState;
        return [state](int inResult) { state->Add(inResult, nullptr); };
    }
    IZOCBulkTransaction::AssetCompletion Asset() const {
        const auto state = mState;
        return
            [state](int inResult, const InterfaceRef<IZOCAsset>& inAsset) { state->Add(inResult, inAsset); };
    }
    std::vector<int> Results() const {
        std::lock_guard<std::mutex> lock(mState->mutex);
        return mState->results;
    }
    std::vector<InterfaceRef<IZOCAsset>> Assets() const {
        std::lock_guard<std::mutex> lock(mState->mutex);
        return mState->assets;
    }

private:
    struct State {
        std::mutex mutex;
        std::vector<int> results;
        std::vector<InterfaceRef<IZOCAsset>> assets;

        void Add(int inResult, const InterfaceRef<IZOCAsset>& inAsset) {
            std::lock_guard<std::mutex> lock(mutex);
            results.push_back(inResult);
            assets.push_back(inAsset);
        }
    };
    shared_ptr<State> mState = make_shared<State>();
};

/// An operation whose end is waited for, with a bulk transaction under it.
struct BulkRun {
    explicit BulkRun(const InterfaceRef<Production>& inTransaction) {
        const auto promise = make_shared<std::promise<int>>();
        end = promise->get_future();
        parent = CompoundAsyncOperation::Create([promise](int inResult) { promise->set_value(inResult); },
                                                inTransaction->GetServer(), false);
        bulk = inTransaction->CreateBulkTransaction(parent);
    }
    int Finish() {
        bulk->FinishedEditing();
        return Wait();
    }
    int Wait() {
        if (end.wait_for(std::chrono::seconds(30)) != std::future_status::ready) {
            ADD_FAILURE() << "the parent operation did not end";
            return 1;
        }
        return end.get();
    }

    std::future<int> end;
    shared_ptr<CompoundAsyncOperation> parent;
    InterfaceRef<IZOCBulkTransaction> bulk;
};

/// The transaction t1 holds the assets A1, with its lists inside, and A2, whose lists stand at URLs of their
/// own, and one enclosure.
class BulkTest : public SessionTest {
protected:
    BulkTest() {
        On("GET /t1/assets",
           JSONAnswer("{'links':[],'assets':[" +
                      AssetBody("A1", ",'enclosures':{'enclosures':[" + EnclosureItem("E1", "notes") +
                                          "],'links':[]},'renditions':{'renditions':[{'zo:renditionId':'R1',"
                                          "'properties':{'zo:mimeType':'image/jpeg'}}],'links':[]}") +
                      "," + AssetBody("A2", "") + "]}"));
        On("GET /A2/enclosures", JSONAnswer("{'enclosures':[" + EnclosureItem("E2", "notes") + "]}"));
        On("GET /A2/renditions", JSONAnswer("{'renditions':[]}"));
        On("GET /t1/enclosures", JSONAnswer("{'enclosures':[" + EnclosureItem("EP", "there_xmp") + "]}"));
        On("POST /t1/bulk/create", [](const RecordedRequest& inRequest) { return Answer(inRequest); });
        On("PUT /t1/bulk/edit", [](const RecordedRequest& inRequest) { return Answer(inRequest); });
        On("POST /t1/bulk/delete", JSONAnswer("{}"));
    }

    static std::string EnclosureItem(const std::string& inID, const std::string& inName) {
        return "{'zo:enclosureId':'" + inID + "','name':'" + inName + "','links':[]}";
    }
    static std::string AssetBody(const std::string& inID, const std::string& inMore) {
        return "{'zo:assetId':'" + inID +
               "','properties':{'name':'Old','description':'D','mediaLocator':'L0','zo:parent':'P0',"
               "'tags':['x'],'cdzo:assetType':'masterclip','projectItemProperties':'pip',"
               "'mergedClipMediaLocators':['M1'],'isMulticamEnabled':false,'foreign':{'kept':[1,2]}},"
               "'links':[" +
               LinkTo(kRelation_Enclosures, "/" + inID + "/enclosures") + "," +
               LinkTo(kRelation_Renditions, "/" + inID + "/renditions") + "]" + inMore + "}";
    }
    static std::string BulkLinks() {
        return "," + LinkTo(kRelation_Bulk_Create, "/t1/bulk/create") + "," +
               LinkTo(kRelation_Bulk_Edit, "/t1/bulk/edit");
    }
    InterfaceRef<Production> MakeTransaction(const std::string& inLinks = BulkLinks() + "," +
                                                                          LinkTo(kRelation_Bulk_Delete,
                                                                                 "/t1/bulk/delete")) {
        return Make<Production>(
            "{'zo:sessionId':'s1','zo:transactionId':'t1','metadata':{},"
            "'properties':{'name':'N'},'links':[" +
            Lists("/t1") + "," + LinkTo(kRelation_Assets_Asset_ById, "/t1/at/{commitId}/a/{assetId}") + "," +
            LinkTo(kRelation_Transactions_Transaction_Commit, "/t1/commit") + inLinks + "]}");
    }

    /// Names what the form brings: new assets A-i, new enclosures E-j with the content C-<data>, and so on.
    static ScriptedAnswer Answer(const RecordedRequest& inRequest) {
        std::vector<std::string> order;
        std::map<std::string, std::pair<std::string, std::string>> assets;
        std::string enclosures;
        const auto append = [](std::string& ioList, const std::string& inItem) {
            ioList += (ioList.empty() ? "" : ",") + inItem;
        };
        for (const FormPart& part : PartsOf(inRequest)) {
            std::vector<std::string> words;
            for (std::size_t at = 0, next; at <= part.name.size(); at = next + 1) {
                next = (std::min)(part.name.find('+', at), part.name.size());
                words.push_back(part.name.substr(at, next - at));
            }
            if (words.back() == "name") {
                continue;
            }
            const bool isNew = words[words.size() - 2].find_first_not_of("0123456789") == std::string::npos;
            const std::string item = words[words.size() - 2];
            const std::string enclosure = "{'enclosureId':'" + (isNew ? "E-" + item : item) +
                                          "','indexId':0,'enclosureContentId':'C-" + part.body.substr(0, 20) +
                                          "'}";
            if (words[0] == "enclosures") {
                append(enclosures, enclosure);
                continue;
            }
            const bool isNewAsset = words[1].find_first_not_of("0123456789") == std::string::npos;
            const std::string id = isNewAsset ? "A-" + words[1] : words[1];
            if (assets.count(id) == 0) {
                order.push_back(id);
            }
            auto& lists = assets[id];
            if (words[2] == "enclosure") {
                append(lists.first, enclosure);
            } else if (words[2] == "rendition") {
                append(lists.second, "{'renditionId':'" + (isNew ? "R-" + item : item) + "','indexId':0}");
            }
        }
        std::string list;
        for (const std::string& id : order) {
            append(list, "{'assetId':'" + id + "','indexId':0,'enclosures':[" + assets[id].first +
                             "],'renditions':[" + assets[id].second + "]}");
        }
        return ScriptedAnswer::JSON(Quote("{'assets':[" + list + "],'enclosures':[" + enclosures + "]}"));
    }

    /// The write requests so far, in order.
    std::vector<std::string> Writes() const {
        std::vector<std::string> lines;
        for (const RecordedRequest& request : net->Requests()) {
            if (request.verb != "GET") {
                lines.push_back(request.verb + " " + request.Path());
            }
        }
        return lines;
    }
    void ExpectForm(const RecordedRequest& inRequest, const FormParts& inParts) const {
        const std::string boundary = BoundaryOf(inRequest);
        EXPECT_FALSE(boundary.empty()) << inRequest.Header("Content-Type");
        EXPECT_EQ(inRequest.CountHeader("Content-Type"), 1u);
        EXPECT_EQ(inRequest.body, FormText(boundary, inParts));
    }
    static AssetBaseProperties Named(const UString& inName) {
        AssetBaseProperties properties;
        properties.name = inName;
        properties.assetType = kAssetType_MasterClip;
        return properties;
    }
    /// A new asset with an enclosure, or with none.
    static bool Add(const InterfaceRef<IZOCBulkTransaction>& inBulk,
                    const IZOCBulkTransaction::AssetCompletion& inCompletion, const UString& inName,
                    const std::string& inEnclosure = "", const std::string& inData = "") {
        return inBulk->CreateNewAsset(inCompletion, Named(inName), ImmutableString(), boost::none,
                                      ImmutableString(inEnclosure), Bytes(inData), ImmutableString(), nullptr,
                                      SourceAssetReference());
    }
    /// The object of properties of an asset made by Named.
    static std::string NamedJSON(const std::string& inName) {
        return Quote("{'name':'" + inName +
                     "','description':'','mediaLocator':'','zo:parent':'','tags':[],'subClip':"
                     "{'mStartBoundary':{'ticks':-9223372036854775808},'mEndBoundary':"
                     "{'ticks':-9223372036854775808}},'cdzo:assetType':'masterclip',"
                     "'projectItemProperties':'','mergedClipMediaLocators':[]}");
    }
    /// Whether a payload is held, so that it can be read without a request.
    bool IsHeld(const std::string& inContentID, const std::string& inText) {
        net->WaitUntilIdle();
        const std::size_t before = net->RequestCount();
        const auto response = server->BlockingGETByContentID(ImmutableString(inContentID), HubURL("/payload"),
                                                             ostnet::http::kWaitForever);
        return net->RequestCount() == before && response && response->payload &&
               response->payload->view() == inText;
    }
};

}  // namespace ZOCL

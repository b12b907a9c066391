// Anna and Ben on one production of a hub that runs as a process of its own; what Anna sees of it she clicks.
#pragma once

#include <memory>

#include "HubSessionTest.h"
#include "ostnet/http/RequestProcessor.h"
#include "User.h"
#include "ZOClient/Publish.h"

namespace ZOCL {

constexpr const char* kPacketName = "clip_xmp";
constexpr const char* kNotes = "notes.txt";
/// Bytes that a careless transport changes.
const std::string kNotesEnd = "\r\n\n \t";
const std::string kAnnasNotes = "notes of anna" + kNotesEnd;

/// The bottom of the request chain: notes what goes to the network. Threads: any.
class RequestLog final : public ostnet::http::ForwardingProcessor {
public:
    struct Request {
        std::string verb;
        std::string path;
        std::string body;
    };

    explicit RequestLog(const shared_ptr<ostnet::http::RequestProcessor>& inNext);

    void Clear();
    std::vector<Request> All() const;
    /// Those that change something, each as its verb and the last part of its path.
    std::vector<std::string> Writes() const;
    std::string BodyOf(const std::string& inEnd) const;
    /// Called before each request goes, on its thread.
    void SetOnRequest(std::function<void()> inFunction);

    bool GET(const Guid&, const ostnet::http::CompletionFunction&, const ImmutableString&, ostnet::Headers,
             const ostnet::http::RequestOptions&) override;
    bool PUT(const Guid&, const ostnet::http::CompletionFunction&, const ImmutableString&, ostnet::Headers,
             const shared_ptr<RecycledMemory const>&, const ostnet::http::RequestOptions&) override;
    bool POST(const Guid&, const ostnet::http::CompletionFunction&, const ImmutableString&, ostnet::Headers,
              const shared_ptr<RecycledMemory const>&, const ostnet::http::RequestOptions&) override;

private:
    void Note(const char* inVerb, const ImmutableString& inURL,
              const shared_ptr<RecycledMemory const>& inPayload);

    mutable std::mutex mMutex;
    std::vector<Request> mRequests;
    std::function<void()> mOnRequest;
};

class RoadTest : public HubSessionTest {
protected:
    using Session = InterfaceRef<IZOCEditingSession>;

    RoadTest();
    ~RoadTest() override;

    /// Both have begun from one commit; Ben has shared first. Of what both have changed, the metadata fits
    /// together; the bins A and C and the notes do not.
    void BeginWork();
    /// Anna's Share, until everything that it began is over.
    bool Share();
    /// Anna's clicks, from the first window to the last.
    void ExpectWholeRoad();
    void ExpectResolve();
    void ExpectShareWindow();
    void Settle();

    /// The message and the commit of the newest version of the production.
    std::pair<std::string, ImmutableString> Newest();
    static std::string Payload(const InterfaceRef<IZOCProduction>& inProduction,
                               const ImmutableString& inName);
    static ImmutableString Head(const Session& inSession);
    static std::string Packet(const std::string& inProperties);

    std::shared_ptr<Member> anna;
    std::shared_ptr<Member> ben;
    Session annas;
    shared_ptr<User> user;
    shared_ptr<RequestLog> log;
    const shared_ptr<Publish::PublishWorkflowTracker> tracker =
        boost::make_shared<Publish::PublishWorkflowTracker>();

    /// What the host does in its part; goes on at once by itself.
    std::function<void(const Publish::Continuation& inContinue, const ImmutableString& inCommitId)> hostPart;
    /// What the host was told, as words.
    std::vector<std::string> told;

private:
    static void Change(const Session& inSession, const UString& inWho, const std::string& inPacket);
    void PlayHost(const char* inWhat, const Publish::Continuation& inContinue,
                  const ImmutableString& inCommitId);

    shared_ptr<ostui::BackEnd> mFormer;
};

}  // namespace ZOCL

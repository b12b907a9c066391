// Builds the sample from nodes, and lets the writer give it its form.
#include "SamplePackets.h"

#include "OrvaneXMP/Namespaces.h"

using namespace OrvaneXMP;

namespace {

/// The readable layout takes more bytes for the same tree.
std::size_t EntriesOf(WriteOptions::Layout inLayout) {
    return inLayout == WriteOptions::Layout::Readable ? 200 : 300;
}

Name XMPDM(const char* inLocal) {
    return Name(kNamespace_XMPDM, inLocal);
}

Name Event(const char* inLocal) {
    return Name(kNamespace_ResourceEvent, inLocal);
}

std::string TwoDigits(std::size_t inNumber) {
    return (inNumber < 10 ? "0" : "") + std::to_string(inNumber);
}

std::string Identifier(std::size_t inNumber) {
    const std::string number = std::to_string(1000000 + inNumber * 7919);
    return "xmp.iid:" + number + "-5c1e-4f7a-9b7d-" + number + "a3c2e";
}

Node EventNumber(std::size_t inNumber) {
    const std::string when =
        "2024-05-" + TwoDigits(1 + inNumber / 60 % 28) + "T10:" + TwoDigits(inNumber % 60) + ":17+02:00";
    return Node::Structure({{Event("action"), Node::Text(inNumber % 3 == 0 ? "saved" : "converted")},
                            {Event("instanceID"), Node::Text(Identifier(inNumber))},
                            {Event("when"), Node::Text(when)},
                            {Event("softwareAgent"), Node::Text("Logging host 4.2 (Linux)")},
                            {Event("changed"), Node::Text("/metadata")}});
}

Node MarkerNumber(std::size_t inNumber, bool inIsChanged) {
    const std::string number = std::to_string(inNumber);
    const Node parameters = Node::Array(
        Kind::Ordered,
        {Node::Structure({{XMPDM("key"), Node::Text("marker_guid")},
                          {XMPDM("value"), Node::Text("0f8fad5b-d9cb-469f-a165-" + Identifier(inNumber))}})});
    return Node::Structure({{XMPDM("startTime"), Node::Text(std::to_string(inNumber * 254016000))},
                            {XMPDM("duration"), Node::Text("25401600")},
                            {XMPDM("name"), Node::Text("Take " + number)},
                            {XMPDM("comment"), Node::Text((inIsChanged ? "Second look: " : "Good light, ") +
                                                          ("second camera, take " + number))},
                            {XMPDM("type"), Node::Text("Comment")},
                            {XMPDM("cuePointParams"), parameters}});
}

Node Tracks(std::size_t inMarkers, Version inVersion) {
    std::vector<Node> markers;
    for (std::size_t number = 0; number < inMarkers; ++number) {
        markers.push_back(MarkerNumber(number, inVersion == Version::Latest && number % 10 == 1));
    }
    return Node::Array(Kind::Unordered,
                       {Node::Structure({{XMPDM("trackName"), Node::Text("Markers")},
                                         {XMPDM("frameRate"), Node::Text("f254016000000")},
                                         {XMPDM("markers"), Node::Array(Kind::Ordered, markers)}})});
}

Node Keywords(std::size_t inCount, Version inVersion) {
    std::vector<Node> items;
    for (std::size_t number = 0; number < inCount; ++number) {
        items.push_back(Node::Text("keyword " + std::to_string(number * 7 % inCount)));
    }
    if (inVersion != Version::Base) {
        items.push_back(Node::Text(inVersion == Version::User ? "interview" : "exterior"));
    }
    return Node::Array(Kind::Unordered, items);
}

Node Title(Version inVersion) {
    const auto spoken = [](const char* inText, const char* inLanguage) {
        return Node::Text(inText).WithQualifier(LanguageName(), Node::Text(inLanguage));
    };
    return Node::Array(Kind::Alternative,
                       {spoken("The harbour at dawn", "x-default"),
                        spoken(inVersion == Version::User ? "Der Hafen im Morgengrauen" : "Der Hafen", "de"),
                        spoken("Le port & la mer", "fr")});
}

bool IsChanged(std::size_t inNumber, Version inVersion) {
    return (inVersion == Version::Latest && inNumber % 10 == 3) ||
           (inVersion == Version::User && inNumber % 10 == 7);
}

}  // namespace

Packet SamplePacket(WriteOptions::Layout inLayout, Version inVersion) {
    const std::size_t entries = EntriesOf(inLayout);
    std::vector<Node> events;
    for (std::size_t number = 0; number < entries + (inVersion == Version::User ? 5 : 0); ++number) {
        events.push_back(EventNumber(number));
    }
    std::vector<Field> properties{
        {Name(kNamespace_XMPMM, "History"), Node::Array(Kind::Ordered, events)},
        {XMPDM("Tracks"), Tracks(entries, inVersion)},
        {Name(kNamespace_DC, "subject"), Keywords(entries / 4, inVersion)},
        {Name(kNamespace_DC, "title"), Title(inVersion)},
        {Name(kNamespace_XMP, "MetadataDate"),
         Node::Text(inVersion == Version::Base ? "2024-05-01T10:00:00Z" : "2024-06-01T10:00:00Z")}};
    for (std::size_t number = 0; number < entries * 2; ++number) {
        const std::string value = "camera setting " + std::to_string(number * 31);
        properties.push_back({Name("http://ns.example.com/camera/1.0/", "setting" + std::to_string(number)),
                              Node::Text(IsChanged(number, inVersion) ? value + " corrected" : value)});
    }
    Packet packet;
    packet.properties = Node::Structure(std::move(properties));
    packet.prefixes.push_back({"http://ns.example.com/camera/1.0/", "camera"});
    return packet;
}

std::string SampleText(WriteOptions::Layout inLayout) {
    WriteOptions options;
    options.layout = inLayout;
    options.padding = 2048;
    return WritePacket(SamplePacket(inLayout), options);
}

const char* NameOf(WriteOptions::Layout inLayout) {
    return inLayout == WriteOptions::Layout::Readable ? "readable" : "compact";
}

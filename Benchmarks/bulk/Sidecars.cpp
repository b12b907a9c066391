#include "Sidecars.h"

#include <random>

namespace bench {

namespace {

constexpr const char* kWords[] = {"harbour", "gull",   "lighthouse", "rope", "tide",  "slate",
                                  "dawn",    "engine", "boat",       "wide", "close", "take",
                                  "scene",   "sound",  "light",      "crew"};
constexpr const char kHead[] =
    "<?xpacket begin=\"\xEF\xBB\xBF\" id=\"W5M0MpCehiHzreSzNTczkc9d\"?>\n"
    "<x:xmpmeta xmlns:x=\"adobe:ns:meta/\">\n"
    " <rdf:RDF xmlns:rdf=\"http://www.w3.org/1999/02/22-rdf-syntax-ns#\">\n"
    "  <rdf:Description rdf:about=\"\" xmlns:dc=\"http://purl.org/dc/elements/1.1/\">\n"
    "   <dc:description><rdf:Alt><rdf:li xml:lang=\"x-default\">";
constexpr const char kMiddle[] = "</rdf:li></rdf:Alt></dc:description>\n   <dc:subject><rdf:Bag>\n";
constexpr const char kTail[] =
    "   </rdf:Bag></dc:subject>\n  </rdf:Description>\n </rdf:RDF>\n</x:xmpmeta>\n<?xpacket end=\"w\"?>";

}  // namespace

std::string SidecarOf(std::size_t inNumber) {
    std::mt19937_64 random(inNumber);
    std::string text = kHead;
    text += "clip " + std::to_string(inNumber) + kMiddle;
    const std::size_t end = kSidecarBytes - (sizeof kTail - 1);
    while (text.size() + 64 < end) {
        text += std::string("    <rdf:li>") + kWords[random() % 16] + " " + kWords[random() % 16] + " " +
                std::to_string(random() % 1000000) + "</rdf:li>\n";
    }
    text.append(end - text.size(), ' ');
    return text + kTail;
}

}  // namespace bench

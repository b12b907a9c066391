// How fast a tree becomes a packet, against the rate at which expat makes a tree of strings of the same text.
#include "OrvaneXMP/PacketWriter.h"
#include "Rounds.h"
#include "SamplePackets.h"
#include "StringTree.h"

int main() {
    constexpr double kTarget = 2.0;
    for (const auto layout : kLayouts) {
        const OrvaneXMP::Packet packet = SamplePacket(layout);
        OrvaneXMP::WriteOptions options;
        options.layout = layout;
        const std::string text = OrvaneXMP::WritePacket(packet, options);
        const auto ours = [&] {
            Require(OrvaneXMP::WritePacket(packet, options).size() == text.size(), "another text");
        };
        const auto baseline = [&] { Require(ParseToStrings(text) != nullptr, "no tree of strings"); };
        const auto seconds = MedianSeconds<2>({ours, baseline});
        const double ratio = seconds[1] / seconds[0];
        std::printf(
            "bench xmp-write: ours %.0f MB/s, baseline %.0f MB/s (expat parsing the same %s packet of %zu KB "
            "into a plain string tree), ratio %.2f, target %.0f: %s\n",
            MegabytesASecond(text.size(), seconds[0]), MegabytesASecond(text.size(), seconds[1]),
            NameOf(layout), text.size() / 1000, ratio, kTarget, ratio >= kTarget ? "holds" : "falls short");
    }
    return 0;
}

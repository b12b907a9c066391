// How fast a packet becomes a tree, against expat with namespaces into a plain tree of strings.
#include "OrvaneXMP/PacketReader.h"
#include "Rounds.h"
#include "SamplePackets.h"
#include "StringTree.h"

int main() {
    constexpr double kTarget = 1.0;
    for (const auto layout : kLayouts) {
        const std::string text = SampleText(layout);
        const auto ours = [&] { Require(static_cast<bool>(OrvaneXMP::ReadPacket(text)), "no packet"); };
        const auto baseline = [&] { Require(ParseToStrings(text) != nullptr, "no tree of strings"); };
        const auto seconds = MedianSeconds<2>({ours, baseline});
        const double ratio = seconds[1] / seconds[0];
        std::printf(
            "bench xmp-parse: ours %.0f MB/s, baseline %.0f MB/s (expat with namespaces into a plain string "
            "tree, %s packet of %zu KB), ratio %.2f, target %.0f: %s\n",
            MegabytesASecond(text.size(), seconds[0]), MegabytesASecond(text.size(), seconds[1]),
            NameOf(layout), text.size() / 1000, ratio, kTarget, ratio >= kTarget ? "holds" : "falls short");
    }
    return 0;
}

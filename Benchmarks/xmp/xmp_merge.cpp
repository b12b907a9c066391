// What merging three parsed packets costs, against parsing the three and writing the result.
#include "OrvaneXMP/PacketReader.h"
#include "OrvaneXMP/PacketWriter.h"
#include "OrvaneXMPCompareAndMerge/Library.h"
#include "Rounds.h"
#include "SamplePackets.h"

int main() {
    namespace merging = OrvaneXMPCompareAndMerge;
    constexpr double kTarget = 1.0;
    merging::StartLibrary();
    for (const auto layout : kLayouts) {
        OrvaneXMP::WriteOptions options;
        options.layout = layout;
        std::vector<std::string> texts;
        std::vector<OrvaneXMP::Packet> packets;
        for (const Version version : {Version::Base, Version::Latest, Version::User}) {
            texts.push_back(OrvaneXMP::WritePacket(SamplePacket(layout, version), options));
            packets.push_back(*OrvaneXMP::ReadPacket(texts.back()).packet);
        }
        const auto merge = [&] {
            return merging::Create<merging::IThreeWayMerge_v1>()->Merge(packets[0], packets[1], packets[2]);
        };
        const auto result = merge();
        Require(result->GetUnResolvedConflicts().empty(), "the sample contradicts itself");
        Require(result->GetDecisions().size() > 50, "the sample has too few changes");
        const auto ours = [&] { Require(static_cast<bool>(merge()), "no result"); };
        const auto parses = [&] {
            for (const std::string& text : texts) {
                Require(static_cast<bool>(OrvaneXMP::ReadPacket(text)), "no packet");
            }
        };
        const auto write = [&] {
            Require(!OrvaneXMP::WritePacket(result->GetMergedPacket(), options).empty(), "no text");
        };
        const auto seconds = MedianSeconds<3>({ours, parses, write});
        const double ratio = (seconds[1] + seconds[2]) / seconds[0];
        std::printf(
            "bench xmp-merge: ours %.2f ms, baseline %.2f ms (three parses and one write of %s packets of "
            "%zu KB, ours too), ratio %.2f, target %.0f: %s\n",
            seconds[0] * 1e3, (seconds[1] + seconds[2]) * 1e3, NameOf(layout), texts[0].size() / 1000, ratio,
            kTarget, ratio >= kTarget ? "holds" : "falls short");
    }
    merging::EndLibrary();
    return 0;
}

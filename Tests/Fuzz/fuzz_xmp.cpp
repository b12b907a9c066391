// Any bytes either are refused with a reason, or make a tree that is written, in both layouts, and read back
// as an equal tree and the same bytes.
#include <cstdint>
#include <cstdlib>
#include <stdexcept>

#include "OrvaneXMP/DateTime.h"
#include "OrvaneXMP/PacketReader.h"
#include "OrvaneXMP/PacketWriter.h"

using namespace OrvaneXMP;

namespace {

void Require(bool inHolds) {
    if (!inHolds) {
        std::abort();
    }
}

void CheckDates(const Node& inNode) {
    if (const auto date = ParseDateTime(inNode.Value())) {
        Require(FormatDateTime(*date) == inNode.Value());
        Require(CompareDateTime(*date, *date) == 0);
    }
    for (const Field& field : inNode.Fields()) {
        CheckDates(field.node);
    }
    for (const Node& item : inNode.Items()) {
        CheckDates(item);
    }
}

void CheckRoundTrip(const Packet& inPacket, WriteOptions::Layout inLayout) {
    WriteOptions options;
    options.layout = inLayout;
    std::string text;
    try {
        text = WritePacket(inPacket, options);
    } catch (const std::length_error&) {
        return;
    }
    const ReadResult back = ReadPacket(text);
    Require(static_cast<bool>(back));
    Require(*back.packet == inPacket);
    Require(back.packet->properties.Hash() == inPacket.properties.Hash());
    Require(WritePacket(*back.packet, options) == text);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* inBytes, std::size_t inSize) {
    const ReadResult result = ReadPacket({reinterpret_cast<const char*>(inBytes), inSize});
    if (!result) {
        Require(!result.failure.reason.empty());
        return 0;
    }
    CheckDates(result.packet->properties);
    CheckRoundTrip(*result.packet, WriteOptions::Layout::Readable);
    CheckRoundTrip(*result.packet, WriteOptions::Layout::Compact);
    return 0;
}

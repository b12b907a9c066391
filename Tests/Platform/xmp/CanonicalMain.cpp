// Reads a packet from standard input and writes it to standard output as the library writes it, for tests
// that compare the two with programs that are not ours. With --compact in the compact layout.
#include <iostream>
#include <iterator>
#include <string>

#include "OrvaneXMP/PacketReader.h"
#include "OrvaneXMP/PacketWriter.h"

int main(int inCount, char** inArguments) {
    const std::string bytes(std::istreambuf_iterator<char>(std::cin), {});
    const OrvaneXMP::ReadResult result = OrvaneXMP::ReadPacket(bytes);
    if (!result) {
        std::cerr << "the packet on standard input was refused: " << result.failure.Text() << "\n";
        return 1;
    }
    OrvaneXMP::WriteOptions options;
    if (inCount > 1 && std::string(inArguments[1]) == "--compact") {
        options.layout = OrvaneXMP::WriteOptions::Layout::Compact;
    }
    std::cout << OrvaneXMP::WritePacket(*result.packet, options);
    return std::cout.flush() ? 0 : 1;
}

// Packets of about 200 KB as hosts write them for a long clip: events, markers and simple properties.
#pragma once

#include <string>

#include "OrvaneXMP/PacketWriter.h"
#include "OrvaneXMP/Tree.h"

constexpr OrvaneXMP::WriteOptions::Layout kLayouts[] = {OrvaneXMP::WriteOptions::Layout::Readable,
                                                        OrvaneXMP::WriteOptions::Layout::Compact};

/// Which of three that a merge starts from: the sides differ from base in dates, titles, keywords, and
/// every tenth property and marker.
enum class Version { Base, Latest, User };

/// Written in the layout, the packet has about 200 KB.
OrvaneXMP::Packet SamplePacket(OrvaneXMP::WriteOptions::Layout inLayout, Version inVersion = Version::Base);
std::string SampleText(OrvaneXMP::WriteOptions::Layout inLayout);
const char* NameOf(OrvaneXMP::WriteOptions::Layout inLayout);

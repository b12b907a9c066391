// Memory for an XML parser that foreign input cannot make it take without bound.
#pragma once

#include <expat.h>

namespace OrvaneXMP {

/// All parsers of one thread together get no more than 24 MiB; beyond it an allocation fails. A parser stays
/// on its thread from its making to its end.
const XML_Memory_Handling_Suite& BoundedParserMemory() noexcept;
/// Of the same memory no more than the half, so that a parser that has more to keep has room for it.
const XML_Memory_Handling_Suite& HalfOfParserMemory() noexcept;

}  // namespace OrvaneXMP

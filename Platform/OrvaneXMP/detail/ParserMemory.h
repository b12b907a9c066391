// Memory for an XML parser that foreign input cannot make it take without bound.
#pragma once

#include <expat.h>

namespace OrvaneXMP {

/// All parsers of one thread together get no more than 24 MiB; beyond it an allocation fails. A parser stays
/// on its thread from its making to its end.
const XML_Memory_Handling_Suite& BoundedParserMemory() noexcept;

}  // namespace OrvaneXMP

// The texts of the relations, made once when the library is loaded.
#include "Relations.h"

#define ZO_RELATION_BASE "http://ns.meridane.example/zo/rel"

namespace ZOCL {

const ImmutableString kRelationBase(ZO_RELATION_BASE);

#define ZOCL_RELATION_WITH_PATH(constant, path) const ImmutableString constant(ZO_RELATION_BASE path);
ZOCL_RELATION_TABLE(ZOCL_RELATION_WITH_PATH)
#undef ZOCL_RELATION_WITH_PATH

#define ZOCL_RELATION_WORD(constant, word) const ImmutableString constant(word);
ZOCL_PLAIN_RELATION_TABLE(ZOCL_RELATION_WORD)
#undef ZOCL_RELATION_WORD

}  // namespace ZOCL

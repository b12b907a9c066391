// The types that cross the boundary of the library, named once for the whole house.
#pragma once

#include <boost/any.hpp>
#include <boost/date_time/posix_time/posix_time_types.hpp>
#include <boost/enable_shared_from_this.hpp>
#include <boost/function.hpp>
#include <boost/make_shared.hpp>
#include <boost/optional.hpp>
#include <boost/shared_ptr.hpp>
#include <boost/smart_ptr/intrusive_ptr.hpp>
#include <boost/weak_ptr.hpp>
#include <string>

namespace ostcore {

using boost::any;
using boost::any_cast;
using boost::bad_any_cast;
using boost::enable_shared_from_this;
using boost::function;
using boost::intrusive_ptr;
using boost::make_shared;
using boost::optional;
using boost::shared_ptr;
using boost::weak_ptr;
using boost::posix_time::ptime;

/// UTF-16 text in the byte order of the machine.
using UString = std::u16string;
/// UTF-8 text.
using U8String = std::string;

}  // namespace ostcore

// The other namespaces of the house speak of the same types without a prefix.
#define ZO_USE_BOUNDARY_TYPES               \
    using ostcore::any;                     \
    using ostcore::any_cast;                \
    using ostcore::bad_any_cast;            \
    using ostcore::enable_shared_from_this; \
    using ostcore::function;                \
    using ostcore::intrusive_ptr;           \
    using ostcore::make_shared;             \
    using ostcore::optional;                \
    using ostcore::ptime;                   \
    using ostcore::shared_ptr;              \
    using ostcore::U8String;                \
    using ostcore::UString;                 \
    using ostcore::weak_ptr;

namespace ostnet {
ZO_USE_BOUNDARY_TYPES
}
namespace RFL {
ZO_USE_BOUNDARY_TYPES
}
namespace ZOCL {
ZO_USE_BOUNDARY_TYPES
}

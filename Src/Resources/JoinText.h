// Joins pieces of a message: texts, numbers and identifiers.
#pragma once

#include <string>
#include <string_view>
#include <type_traits>

#include "ZOClient/Types.h"

namespace ZOCL {

namespace detail {
inline void AppendPiece(std::string& ioText, std::string_view inPiece) {
    ioText.append(inPiece);
}
inline void AppendPiece(std::string& ioText, const Guid& inPiece) {
    ioText.append(inPiece.ToString());
}
template <class T, std::enable_if_t<std::is_integral<T>::value, int> = 0>
void AppendPiece(std::string& ioText, T inPiece) {
    ioText.append(std::to_string(inPiece));
}
}  // namespace detail

template <class... Pieces>
std::string JoinText(const Pieces&... inPieces) {
    std::string text;
    (detail::AppendPiece(text, inPieces), ...);
    return text;
}

}  // namespace ZOCL

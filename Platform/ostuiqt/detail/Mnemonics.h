// Gives captions a letter each by which the keyboard reaches them.
#pragma once

#include <vector>

#include <QtCore/QString>

namespace ZOClientQt {
namespace detail {

/// The captions with an "&" before their letter, in the same order; all other ampersands are doubled. A
/// letter is given once: the first of a word before any other, the earlier caption before the later one. A
/// caption for which none is left has none.
std::vector<QString> AssignMnemonics(const std::vector<QString>& inCaptions);

}  // namespace detail
}  // namespace ZOClientQt

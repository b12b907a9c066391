// What the windows need of the driver of the main-thread queue.
#pragma once

namespace ZOClientQt {
namespace detail {

/// Puts the driver's wake function in place again, should somebody have replaced it. Without effect when
/// there is no driver.
void TakeWakeFunction();

}  // namespace detail
}  // namespace ZOClientQt

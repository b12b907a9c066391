// The controls of a window, in the order in which they stand.
#pragma once

#include <memory>
#include <string>
#include <unordered_map>
#include <vector>

#include "ostuiqt/detail/ControlWidget.h"

namespace ZOClientQt {
namespace detail {

class ControlSet {
public:
    /// Null is left out, and so is a control that is there already.
    ControlWidget* Add(std::unique_ptr<ControlWidget> inControl) {
        if (!inControl || !mByID.emplace(inControl->GetID(), inControl.get()).second) {
            return nullptr;
        }
        mAll.push_back(std::move(inControl));
        return mAll.back().get();
    }
    /// Null when there is none.
    ControlWidget* Find(const std::string& inID) const {
        const auto found = mByID.find(inID);
        return found == mByID.end() ? nullptr : found->second;
    }
    const std::vector<std::unique_ptr<ControlWidget>>& GetAll() const { return mAll; }

private:
    std::vector<std::unique_ptr<ControlWidget>> mAll;
    std::unordered_map<std::string, ControlWidget*> mByID;
};

}  // namespace detail
}  // namespace ZOClientQt

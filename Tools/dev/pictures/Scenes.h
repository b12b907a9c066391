// The windows that pictures are taken of, filled as a user would find them.
#pragma once

#include <functional>
#include <string>
#include <vector>

#include "ostui/Dialog.h"

struct Scene {
    /// Of the picture.
    std::string name;
    /// Empty for a window that is made in code.
    std::string layout;
    /// Makes a window that has no layout; gives any other its content.
    std::function<void(ostui::Dialog& ioDialog)> fill;
    bool isRightToLeft = false;
    /// Pixels of the picture for one of the window.
    double scale = 1;
};

std::vector<Scene> GetScenes();

/// A window with a control of each kind.
ostui::View MakeGallery();

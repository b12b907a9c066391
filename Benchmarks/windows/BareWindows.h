// The same windows made of bare Qt, to measure against.
#pragma once

#include <vector>

#include <QtCore/QStringList>
#include <QtWidgets/QDialog>
#include <QtWidgets/QTreeView>

using Rows = std::vector<QStringList>;

/// A window for sharing: a tree of a few rows, a text, a comment, two buttons.
class BareShareWindow final : public QDialog {
public:
    explicit BareShareWindow(const Rows& inRows);
};

/// A window with a QTreeWidget.
class BareTreeWidgetWindow final : public QDialog {
public:
    explicit BareTreeWidgetWindow(const Rows& inRows);
};

/// A window with a QTreeView over the least model that there can be: a list, sorted by comparing the texts.
class BareModelWindow final : public QDialog {
public:
    explicit BareModelWindow(const Rows& inRows);
};

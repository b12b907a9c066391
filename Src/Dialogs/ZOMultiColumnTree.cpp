// Columns and their properties.
#include "Dialogs/ZOMultiColumnTree.h"

#include <algorithm>

#include "ostcore/config/ZString.h"

namespace ZOCL {

namespace {

std::string IdentifierOf(const std::string& inText) {
    const std::string key = inText.substr(0, inText.find('='));
    return key.substr(key.rfind('/') + 1);
}

}  // namespace

void ZOMultiColumnTree::SetColumns(const std::vector<const char*>& inTexts) {
    std::vector<ostui::TreeColumn> columns;
    for (const char* text : inTexts) {
        ostui::TreeColumn column;
        column.id = IdentifierOf(text);
        column.title = ostcore::ZString(text).AsUTF8();
        columns.push_back(std::move(column));
    }
    const std::string first = columns.empty() ? std::string() : columns.front().id;
    mTree->SetColumns(std::move(columns));
    mTree->SetSort(first, true);
}

void ZOMultiColumnTree::ApplyAllColumnProperties(const TreeProperties& inProperties) {
    const std::vector<ostui::TreeColumn> columns = mTree->GetColumns();
    // In the order of their places, so that each lands where it was.
    std::vector<std::pair<int, std::string>> places;
    for (const ostui::TreeColumn& column : columns) {
        const auto known = inProperties.columns.find(column.id);
        if (known == inProperties.columns.end()) {
            continue;
        }
        if (known->second.width) {
            mTree->SetColumnWidth(column.id, *known->second.width);
        }
        if (known->second.index && *known->second.index < static_cast<int>(columns.size())) {
            places.emplace_back(*known->second.index, column.id);
        }
    }
    std::sort(places.begin(), places.end());
    for (const auto& place : places) {
        mTree->MoveColumn(place.second, place.first);
    }
    const bool isSortKnown = std::any_of(
        columns.begin(), columns.end(),
        [&](const ostui::TreeColumn& inColumn) { return inColumn.id == inProperties.sortColumnID; });
    if (isSortKnown) {
        mTree->SetSort(inProperties.sortColumnID, inProperties.isSortDirectionAscending);
    }
}

TreeProperties ZOMultiColumnTree::StoreAllColumnProperties() const {
    TreeProperties properties;
    int index = 0;
    for (const ostui::TreeColumn& column : mTree->GetColumns()) {
        ColumnProperties& stored = properties.columns[column.id];
        stored.index = index++;
        if (column.width > 0) {
            stored.width = column.width;
        }
    }
    properties.sortColumnID = mTree->GetSortColumn();
    properties.isSortDirectionAscending = mTree->IsSortAscending();
    return properties;
}

}  // namespace ZOCL

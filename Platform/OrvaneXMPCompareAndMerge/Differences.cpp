// Walks two packets side by side.
#include "OrvaneXMPCompareAndMerge/Differences.h"

#include "OrvaneXMPCompareAndMerge/detail/Alignment.h"

namespace OrvaneXMPCompareAndMerge {

namespace {

using OrvaneXMP::PathStep;

class Walk {
public:
    std::vector<Difference> Take() { return std::move(mFound); }

    void Below(const SharedPath& inAbove, const PathStep& inStep, const Row<2>& inSides) {
        const Node& before = *inSides[0];
        const Node& after = *inSides[1];
        if (before.IsSameAs(after)) {
            return;
        }
        const Shape shape = ShapeOf(before);
        const bool isTakenApart =
            (shape == Shape::Structure || shape == Shape::LanguageAlternative) && ShapeOf(after) == shape;
        if (isTakenApart) {
            TakeApart(inAbove.Below(inStep), before, after);
        } else if (before != after) {
            const ChangeKind kind = !before.IsPresent()  ? ChangeKind::Added
                                    : !after.IsPresent() ? ChangeKind::Removed
                                                         : ChangeKind::Changed;
            mFound.push_back({inAbove.Below(inStep), kind, before, after});
        }
    }

    void Fields(const SharedPath& inPath, Range<Field> inBefore, Range<Field> inAfter,
                PathStep (*inStep)(const Name&)) {
        ForEachName(
            std::array<Range<Field>, 2>{inBefore, inAfter},
            [&](const Name& inName, const Row<2>& inSides) { Below(inPath, inStep(inName), inSides); });
    }

private:
    void TakeApart(const SharedPath& inPath, const Node& inBefore, const Node& inAfter) {
        if (inBefore.IsStructure()) {
            Fields(inPath, inBefore.Fields(), inAfter.Fields(), &PathStep::ToField);
        } else {
            ForEachLanguage(std::array<std::vector<SpokenItem>, 2>{ByLanguage(inBefore), ByLanguage(inAfter)},
                            [&](std::string_view inLanguage, const Row<2>& inSides) {
                                Below(inPath, PathStep::ToLanguage(inLanguage), inSides);
                            });
        }
        Fields(inPath, inBefore.Qualifiers(), inAfter.Qualifiers(), &PathStep::ToQualifier);
    }

    std::vector<Difference> mFound;
};

}  // namespace

std::vector<Difference> FindDifferences(const Packet& inOld, const Packet& inNew) {
    RequireProperties(inOld);
    RequireProperties(inNew);
    Walk walk;
    const Node oldAbout = AboutOf(inOld);
    const Node newAbout = AboutOf(inNew);
    walk.Below(SharedPath(), PathStep::ToField(AboutName()), {&oldAbout, &newAbout});
    walk.Fields(SharedPath(), inOld.properties.Fields(), inNew.properties.Fields(), &PathStep::ToField);
    return walk.Take();
}

}  // namespace OrvaneXMPCompareAndMerge

// Reference counting and interface query through a class of two interfaces.
#include <gtest/gtest.h>

#include "RFL/RFLUnknown.h"

namespace {

struct IShape : RFL::RFLUnknown {
    static constexpr RFL::InterfaceID kInterfaceID{1, 2};
    virtual int Corners() = 0;
};
struct INamed : RFL::RFLUnknown {
    static constexpr RFL::InterfaceID kInterfaceID{3, 4};
    virtual const char* Name() = 0;
};
struct IOther : RFL::RFLUnknown {
    static constexpr RFL::InterfaceID kInterfaceID{5, 6};
};

class Square : public IShape, public INamed {
public:
    explicit Square(bool& outIsGone) : mIsGone(outIsGone) {}
    ~Square() override { mIsGone = true; }
    std::uint32_t AddRef() noexcept override { return mCount.Add(); }
    std::uint32_t Release() noexcept override {
        const std::uint32_t left = mCount.Drop();
        if (left == 0) {
            delete this;
        }
        return left;
    }
    int QueryInterface(const RFL::InterfaceID& inID, void** outInterface) noexcept override {
        const int result = QueryInterfaceNoAddRef(inID, outInterface);
        if (result >= 0) {
            AddRef();
        }
        return result;
    }
    int QueryInterfaceNoAddRef(const RFL::InterfaceID& inID, void** outInterface) noexcept override {
        *outInterface = nullptr;
        if (inID == IShape::kInterfaceID) {
            *outInterface = static_cast<IShape*>(this);
        } else if (inID == INamed::kInterfaceID) {
            *outInterface = static_cast<INamed*>(this);
        }
        return *outInterface ? RFL::kResultSuccess : RFL::kResultInterfaceNotSupported;
    }
    int Corners() override { return 4; }
    const char* Name() override { return "square"; }

private:
    RFL::RefCount mCount;
    bool& mIsGone;
};

}  // namespace

TEST(InterfaceRef, LivesAsLongAsAnyInterfaceIsHeld) {
    bool isGone = false;
    RFL::InterfaceRef<INamed> named;
    {
        const RFL::InterfaceRef<IShape> shape(static_cast<IShape*>(new Square(isGone)));
        EXPECT_EQ(shape->Corners(), 4);
        named = RFL::QueryInterface<INamed>(shape);
        EXPECT_FALSE(RFL::QueryInterface<IOther>(shape));
    }
    EXPECT_FALSE(isGone);
    EXPECT_STREQ(named->Name(), "square");
    const RFL::InterfaceRef<INamed> moved = std::move(named);
    named = moved;
    named.Reset();
    EXPECT_FALSE(isGone);
    const_cast<RFL::InterfaceRef<INamed>&>(moved).Reset();
    EXPECT_TRUE(isGone);
}

TEST(InterfaceRef, ANullReferenceThrowsWithItsText) {
    const RFL::InterfaceRef<IShape> none;
    EXPECT_FALSE(RFL::QueryInterface<INamed>(none));
    try {
        none->Corners();
        FAIL() << "no exception";
    } catch (const RFL::Exception& error) {
        EXPECT_STREQ(error.what(), "A NULL interface pointer has been dereferenced.");
    }
}

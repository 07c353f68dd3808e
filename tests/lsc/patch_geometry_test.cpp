#include <limits>
#include <stdexcept>

#include <gtest/gtest.h>

#include "lsc/patch_geometry.h"

namespace lsc {
namespace {

TEST(PatchBreakpoints, LeftTruncatesAndCentreRounds) {
    const PatchBreakpoints b = patchBreakpoints(1001, 1001, 0.25, 0.5, 0.25, 0.5);
    EXPECT_EQ(b.x[1], 250u); // 250.25 truncated
    EXPECT_EQ(b.x[2], 751u); // 500.5 rounded up
    EXPECT_EQ(b.x[3], 1001u);
    EXPECT_EQ(b.y[1], 250u);
    EXPECT_EQ(b.y[2], 751u);
}

TEST(PatchBreakpoints, NonsensicalFractionsStayWithinRange) {
    const PatchBreakpoints b =
        patchBreakpoints(100, 100, -0.5, 1e30, std::numeric_limits<double>::quiet_NaN(), 0.5);
    EXPECT_EQ(b.x[1], 0u);
    EXPECT_EQ(b.x[2], 0xffffffffu);
    EXPECT_EQ(b.y[1], 0u);
    EXPECT_FALSE(patchGeometryUsable(b));
}

TEST(PatchGeometryUsable, RefusesPatchesWithoutPixels) {
    EXPECT_TRUE(patchGeometryUsable(patchBreakpoints(64, 48, 0.25, 0.5, 0.25, 0.5)));
    EXPECT_FALSE(patchGeometryUsable(patchBreakpoints(64, 48, 0.0, 0.5, 0.25, 0.5)));
    EXPECT_FALSE(patchGeometryUsable(patchBreakpoints(64, 48, 0.25, 0.0, 0.25, 0.5)));
    EXPECT_FALSE(patchGeometryUsable(patchBreakpoints(64, 48, 0.5, 0.5, 0.25, 0.5)));
    EXPECT_FALSE(patchGeometryUsable(patchBreakpoints(64, 48, 0.25, 0.5, 0.25, 0.75)));
    EXPECT_FALSE(patchGeometryUsable(patchBreakpoints(3, 48, 0.25, 0.5, 0.25, 0.5)));
}

TEST(PatchGeometryUsable, UsableBreakpointsThrowWithAClearMessage) {
    EXPECT_NO_THROW(usablePatchBreakpoints(64, 48, 0.25, 0.5, 0.25, 0.5));
    try {
        usablePatchBreakpoints(64, 48, 0.6, 0.5, 0.25, 0.5);
        FAIL() << "no exception";
    } catch (const std::runtime_error& e) {
        EXPECT_STREQ(e.what(), "Patch geometry leaves a patch without pixels: the patch factors "
                               "(or patch sizes) must give left and top patches of at least one "
                               "pixel and leave room for the right and bottom patches.");
    }
}

TEST(ExportedPatchSizes, RoundTheOuterPatchesAndTruncateTheCentre) {
    const ExportedPatchSizes s = exportedPatchSizes(1001, 1001, 0.25, 0.5, 0.25, 0.5);
    EXPECT_EQ(s.left, 250);
    EXPECT_EQ(s.center, 500);
    EXPECT_EQ(s.right, 251);
    EXPECT_EQ(s.top, 250);
    EXPECT_EQ(s.middle, 500);
    EXPECT_EQ(s.bottom, 251);

    const ExportedPatchSizes t = exportedPatchSizes(64, 48, 0.25, 0.5, 0.25, 0.5);
    EXPECT_EQ(t.left, 16);
    EXPECT_EQ(t.center, 32);
    EXPECT_EQ(t.right, 16);
    EXPECT_EQ(t.top, 12);
    EXPECT_EQ(t.middle, 24);
    EXPECT_EQ(t.bottom, 12);
}

TEST(PatchStep, EncodesFourTimesTwoOverSizeInFixedPoint) {
    const PatchStep p250 = patchStep(250);
    EXPECT_EQ(p250.msb, 0u);
    EXPECT_EQ(p250.lsb, 0x83126e9u);

    const PatchStep p16 = patchStep(16);
    EXPECT_EQ(p16.msb, 0u);
    EXPECT_EQ(p16.lsb, 0x80000000u);

    const PatchStep p3 = patchStep(3);
    EXPECT_EQ(p3.msb, 2u);
    EXPECT_EQ(p3.lsb, 0xaaaaaaaau);

    const PatchStep p2 = patchStep(2);
    EXPECT_EQ(p2.msb, 4u);
    EXPECT_EQ(p2.lsb, 0u);
}

TEST(PatchStep, SizesWithoutAFiniteStepGiveZeroRegisters) {
    for (std::int64_t size : {0, -1, -250}) {
        const PatchStep p = patchStep(size);
        EXPECT_EQ(p.msb, 0u) << size;
        EXPECT_EQ(p.lsb, 0u) << size;
    }
    // Step 8 does not fit the 3-bit integer field and wraps.
    const PatchStep p1 = patchStep(1);
    EXPECT_EQ(p1.msb, 0u);
    EXPECT_EQ(p1.lsb, 0u);
}

} // namespace
} // namespace lsc

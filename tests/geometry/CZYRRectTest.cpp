// Rectangles: the inverted default, bounding-box checks, intersection, union and touch.
#include <gtest/gtest.h>

#include <limits>

#include "zyr/std/core/CZYRError.h"
#include "zyr/std/geometry/CZYRRect.h"

using namespace ZYRStd;
using namespace ZYRPublic;

namespace {

// Expected values in the constructor's order: left, bottom, right, top.
::testing::AssertionResult is(const CZYRRect& got, double l, double b, double r, double t) {
    const sZYRRect& g = got;
    if (g.left == l && g.bottom == b && g.right == r && g.top == t)
        return ::testing::AssertionSuccess();
    return ::testing::AssertionFailure() << "got left " << g.left << " bottom " << g.bottom
                                         << " right " << g.right << " top " << g.top;
}

} // namespace

TEST(CZYRRectTest, InvertedDefaultGrowsToItsPoints) {
    const CZYRRect made(1, 2, 3, 4); // left, bottom, right, top
    const sZYRRect& rec = made;
    EXPECT_EQ(rec.top, 4) << "the record keeps top before right";
    EXPECT_EQ(rec.right, 3);

    const double huge = std::numeric_limits<double>::max();
    CZYRRect r;
    EXPECT_TRUE(is(r, huge, huge, -huge, -huge));
    EXPECT_TRUE(r.isempty());
    EXPECT_FALSE(r.isBoundingBox());
    r.updateBBoxPoint(5, 6);
    EXPECT_TRUE(is(r, 5, 6, 5, 6));
    EXPECT_TRUE(r.isBoundingBox());
    EXPECT_TRUE(r.isempty()) << "a single point has no area";
    r.updateBBoxPoint(-1, 10);
    r.updateBBoxPoint(2, 0);
    EXPECT_TRUE(is(r, -1, 0, 5, 10));
    EXPECT_FALSE(r.isempty());

    CZYRRect u;
    u.unionRect(CZYRRect(1, 2, 3, 4));
    EXPECT_TRUE(u == CZYRRect(1, 2, 3, 4)) << "the default is neutral for union";
    u.unionRect(CZYRRect(-5, 3, 0, 9));
    EXPECT_TRUE(is(u, -5, 2, 3, 9));
}

TEST(CZYRRectTest, BoundingBoxCheck) {
    CZYRRect r;
    r.setRect(CZYRRect(3, 0, 1, 1));
    EXPECT_TRUE(is(r, 3, 0, 1, 1)) << "setRect does not check";
    EXPECT_NO_THROW(r.setBoundingBox(CZYRRect(0, 0, 0, 0)));
    try {
        r.setBoundingBox(CZYRRect(0, 5, 1, 4));
        FAIL() << "top below bottom must be refused";
    } catch (const CZYRError& e) {
        EXPECT_EQ(e.getError(), kZYRErrorBadParam);
        EXPECT_STREQ(e.getMessage(), "Invalid bounding box set");
        EXPECT_STREQ(e.getSrcFileName(), "source/zyr/std/CZYRRect");
    }
    EXPECT_TRUE(is(r, 0, 5, 1, 4)) << "the refused values are kept";
    EXPECT_THROW(r.setBoundingBox(CZYRRect(2, 0, 1, 1)), CZYRError);
}

TEST(CZYRRectTest, IntersectionAndTouch) {
    CZYRRect r(0, 0, 10, 10);
    r.intersectRect(CZYRRect(5, -5, 15, 8));
    EXPECT_TRUE(is(r, 5, 0, 10, 8));

    const CZYRRect left(0, 0, 1, 1), right(1, 0, 2, 1);
    EXPECT_TRUE(left.touch(right)) << "a shared edge touches";
    EXPECT_TRUE(right.touch(left));
    EXPECT_TRUE(left.touch(CZYRRect(1, 1, 2, 2))) << "a shared corner touches";
    EXPECT_TRUE(left.touch(CZYRRect(0.25, 0.25, 0.5, 0.5))) << "containment touches";
    EXPECT_FALSE(left.touch(CZYRRect(1.5, 0, 2, 1)));
    EXPECT_FALSE(left.touch(CZYRRect(0, 1.001, 1, 2)));

    CZYRRect edge = left;
    edge.intersectRect(right);
    EXPECT_TRUE(is(edge, 0, 0, 0, 0)) << "an intersection without area collapses to zeros";
    CZYRRect apart(0, 0, 1, 1);
    apart.intersectRect(CZYRRect(5, 5, 6, 6));
    EXPECT_TRUE(is(apart, 0, 0, 0, 0));
}

#include <gtest/gtest.h>

#include "frame/Matrix.h"
#include "frame/SafeArray.h"

using ZentMatrix::CMatrix;

TEST(SafeArray, InitZeroesAndFreeEmpties) {
    CSafeArray<int> a;
    a.init(0);
    EXPECT_EQ(a.count(), 0u);
    EXPECT_NE(a.data(), nullptr);  // one element held, none reported
    a.free();
    EXPECT_EQ(a.count(), 0u);
    EXPECT_EQ(a.data(), nullptr);
    struct Record { int a; float b; int c; };
    CSafeArray<Record> r(5);
    r[4].b = 2.0f;
    r.init(3);
    EXPECT_EQ(r.count(), 3u);
    EXPECT_EQ(r[2].b, 0.0f);
}

TEST(Matrix, ConstructionSetsFillThenDiagonal) {
    CMatrix<float> m(2, 3, 5.0f, 1.0f);
    EXPECT_EQ(m(0, 0), 1.0f);
    EXPECT_EQ(m(1, 1), 1.0f);
    EXPECT_EQ(m(1, 2), 5.0f);
    CMatrix<float> v(3, 1, 2.0f, 2.0f), w(3, 1, 3.0f, 3.0f);
    EXPECT_EQ(v.dot(w), 18.0f);
    v.scale(0.5f);
    EXPECT_EQ(v[2], 1.0f);
}

TEST(Matrix, InverseByLuWithPivoting) {
    CMatrix<float> negated(2, 2, 0.0f, -1.0f), inv(2, 2);
    ASSERT_TRUE(negated.inverse(inv));
    EXPECT_EQ(inv(0, 0), -1.0f);
    EXPECT_EQ(inv(1, 1), -1.0f);
    EXPECT_EQ(inv(0, 1), 0.0f);

    // A zero first pivot needs the row exchange.
    CMatrix<float> swap(2, 2);
    swap(0, 1) = 2.0f;
    swap(1, 0) = 4.0f;
    ASSERT_TRUE(swap.inverse(swap));  // in place
    EXPECT_EQ(swap(0, 1), 0.25f);
    EXPECT_EQ(swap(1, 0), 0.5f);
    EXPECT_EQ(swap(0, 0), 0.0f);

    CMatrix<float> a(3, 3);
    const float values[9] = {2, 1, 0, 1, 3, 1, 0, 1, 4};
    for (int i = 0; i < 9; ++i) a(i / 3, i % 3) = values[i];
    CMatrix<float> ai(3, 3);
    ASSERT_TRUE(a.inverse(ai));
    for (uint32_t r = 0; r < 3; ++r)
        for (uint32_t c = 0; c < 3; ++c) {
            float s = 0;
            for (uint32_t k = 0; k < 3; ++k) s += a(r, k) * ai(k, c);
            EXPECT_NEAR(s, r == c ? 1.0f : 0.0f, 1e-5f);
        }
}

TEST(Matrix, SingularOrNonSquareLeavesTargetUnchanged) {
    CMatrix<float> ones(2, 2, 1.0f, 1.0f), target(2, 2, 7.0f, 7.0f);
    EXPECT_FALSE(ones.inverse(target));
    EXPECT_EQ(target(0, 1), 7.0f);
    CMatrix<float> tiny(1, 1, 1e-21f, 1e-21f), t1(1, 1, 3.0f, 3.0f);
    EXPECT_FALSE(tiny.inverse(t1));
    EXPECT_EQ(t1(0, 0), 3.0f);
    CMatrix<float> wide(2, 3, 0.0f, 1.0f);
    EXPECT_FALSE(wide.inverse(target));
}

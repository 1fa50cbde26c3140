// The growable value array used for depth bounds, thicknesses and kind lists.
#include "zodevi/value_array.h"

#include <gtest/gtest.h>

namespace {

TEST(CZodEVIValueArray, AddInsertAndGrow)
{
    CZodEVIValueArray<double> a;
    EXPECT_EQ(a.Add(1.3), 0);
    EXPECT_EQ(a.Add(3.5), 1);
    a.InsertAt(1, 2.0);
    ASSERT_EQ(a.GetSize(), 3);
    EXPECT_EQ(a[0], 1.3);
    EXPECT_EQ(a[1], 2.0);
    EXPECT_EQ(a[2], 3.5);
    a.InsertAt(5, 9.0);
    ASSERT_EQ(a.GetSize(), 6);
    EXPECT_EQ(a[3], 0.0);
    EXPECT_EQ(a[5], 9.0);
    for (int i = 0; i < 100; ++i)
        a.Add(a[0]); // the element added lives in the storage being grown
    EXPECT_EQ(a[105], 1.3);
    a.SetSize(2);
    EXPECT_EQ(a.GetSize(), 2);
    a.SetSize(4);
    EXPECT_EQ(a[3], 0.0);

    CZodEVIValueArray<int> kinds{21, 22};
    CZodEVIValueArray<int> copy(kinds);
    kinds[0] = 0;
    EXPECT_EQ(copy[0], 21);
    EXPECT_EQ(copy.GetSize(), 2);
}

} // namespace

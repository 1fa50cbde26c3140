// Tests of result-buffer lists: value kinds, copies and release.
#include <gtest/gtest.h>

#include "velhost/resbuf.h"

namespace {

TEST(Resbuf, KindOfEachTypeCode)
{
    const struct {
        int code;
        VelRbKind kind;
    } cases[] = {
        {RTSHORT, VelRbKind::Short},   {RTSTR, VelRbKind::String}, {RTREAL, VelRbKind::Real},
        {RT3DPOINT, VelRbKind::Point}, {RTLONG, VelRbKind::Long},  {RTNONE, VelRbKind::None},
        {1000, VelRbKind::String},     {1001, VelRbKind::String},  {1002, VelRbKind::String},
        {1004, VelRbKind::Binary},     {1005, VelRbKind::String},  {1010, VelRbKind::Point},
        {1013, VelRbKind::Point},      {1040, VelRbKind::Real},    {1042, VelRbKind::Real},
        {1070, VelRbKind::Short},      {1071, VelRbKind::Long},    {1, VelRbKind::String},
        {10, VelRbKind::Point},        {40, VelRbKind::Real},      {70, VelRbKind::Short},
        {90, VelRbKind::Long},         {330, VelRbKind::String},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.code);
        EXPECT_EQ(velRbKind(c.code), c.kind);
    }
}

TEST(Resbuf, DuplicateIsDeepAndReleaseFreesEverything)
{
    VelRbBuilder list;
    list.add(velRbString(1001, "APP")).add(velRbBinary(std::string_view("\0\x01", 2))).add(velRbShort(1070, 7));
    VelRbPtr copy(acutDupRb(list.head()));
    list.head()->resval.rstring[0] = 'X';
    EXPECT_EQ(velRbText(copy.get()), "APP");
    EXPECT_EQ(copy->rbnext->resval.rbinary.clen, 2);
    EXPECT_EQ(copy->rbnext->rbnext->resval.rint, 7);
    EXPECT_EQ(acutRelRb(list.release()), RTNORM);
    EXPECT_EQ(acutRelRb(nullptr), RTNORM);
    VelRbPtr fresh(acutNewRb(RTSTR));
    EXPECT_EQ(velRbText(fresh.get()), "");
    EXPECT_EQ(velRbText(nullptr), "");
}

} // namespace

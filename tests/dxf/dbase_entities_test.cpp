// Tests of the read-only entity walk: entities in file order with their values decoded,
// vertices and attributes folded into their owner, paper space marked, XData on demand.
#include "velhost/entities.h"

#include <gtest/gtest.h>

#include <memory>
#include <string>

#include "velhost/dbase.h"

namespace {

// An R12 drawing in the Windows-1252 code page ("\xE9" is é).
const std::string kDrawing =
    "  0\nSECTION\n  2\nHEADER\n  9\n$ACADVER\n  1\nAC1009\n  9\n$DWGCODEPAGE\n  3\nANSI_1252\n  0\nENDSEC\n"
    "  0\nSECTION\n  2\nTABLES\n  0\nTABLE\n  2\nAPPID\n 70\n1\n"
    "  0\nAPPID\n  2\nVELANTO_RSX\n 70\n0\n  0\nENDTAB\n  0\nENDSEC\n"
    "  0\nSECTION\n  2\nENTITIES\n"
    "  0\nLINE\n  5\n2A\n  8\nR\xE9seau EP\n 10\n1.5\n 20\n2\n 30\n0\n 11\n4.5\n 21\n6\n 31\n12\n"
    "1001\nVELANTO_RSX\n1000\nB\xE9ton 400\n1040\n1.25\n"
    "  0\nPOLYLINE\n  5\n2B\n 66\n1\n 70\n8\n"
    "  0\nVERTEX\n  5\n2C\n 10\n0\n 20\n0\n 30\n1\n"
    "  0\nVERTEX\n  5\n2D\n 10\n3\n 20\n4\n 30\n1\n"
    "  0\nSEQEND\n  5\n2E\n"
    "  0\nINSERT\n  5\n2F\n  8\nREGARDS\n 66\n1\n  2\nREGARD\n 10\n7\n 20\n8\n"
    "  0\nATTRIB\n  5\n30\n  1\nRE1\n  2\nNUMERO\n"
    "  0\nSEQEND\n  5\n31\n"
    "  0\nPOINT\n 67\n1\n 10\n5\n 20\n5\n"
    "  0\nENDSEC\n  0\nEOF\n";

} // namespace

TEST(VelReadEntities, WalksEntitiesInFileOrder)
{
    std::unique_ptr<AcDbDatabase> database;
    ASSERT_EQ(velReadDrawing(kDrawing, "entites.dxf", database).description(), "");
    std::size_t skipped = 99;
    const std::vector<VelEntity> entities = velReadEntities(*database, &skipped);
    EXPECT_EQ(skipped, 0u);
    ASSERT_EQ(entities.size(), 4u);

    const VelEntity& line = entities[0];
    EXPECT_EQ(line.dxfName, "LINE");
    EXPECT_EQ(line.handle, 0x2Au);
    EXPECT_EQ(line.layer, "Réseau EP");
    EXPECT_FALSE(line.paperSpace);
    EXPECT_EQ(line.real(11), 4.5);
    EXPECT_EQ(line.real(31), 12.0);
    EXPECT_EQ(line.real(40), std::nullopt);
    EXPECT_EQ(line.text(8), "Réseau EP");
    for (const VelDxfValue& value : line.values)
        EXPECT_LT(value.code, 1000) << "XData is not among the values";
    VelRbPtr xdata(line.xData("VELANTO_RSX"));
    ASSERT_TRUE(xdata);
    ASSERT_NE(xdata->rbnext, nullptr);
    EXPECT_EQ(velRbText(xdata->rbnext), "Béton 400");
    EXPECT_FALSE(VelRbPtr(line.xData("AUTRE")));

    const VelEntity& polyline = entities[1];
    EXPECT_EQ(polyline.dxfName, "POLYLINE");
    ASSERT_EQ(polyline.children.size(), 2u);
    EXPECT_EQ(velDxfReal(polyline.children[1], 10), 3.0);
    EXPECT_EQ(velDxfReal(polyline.children[1], 30), 1.0);

    const VelEntity& insert = entities[2];
    EXPECT_EQ(insert.text(2), "REGARD");
    ASSERT_EQ(insert.children.size(), 1u);
    EXPECT_EQ(insert.children[0][0].code, 5);

    const VelEntity& point = entities[3];
    EXPECT_TRUE(point.paperSpace);
    EXPECT_EQ(point.layer, "0");
    EXPECT_NE(point.handle, 0u); // a handle-less R12 entity still gets one, so that it opens
    EXPECT_FALSE(VelRbPtr(point.xData(nullptr)));
}

TEST(VelReadEntities, NewDrawingHasNone)
{
    AcDbDatabase database;
    EXPECT_TRUE(velReadEntities(database).empty());
}

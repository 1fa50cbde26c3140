// Templates and template arrays: texts per network, deep copies, ownership.
#include "schedule/art_template.hpp"

#include <gtest/gtest.h>

using namespace zodevi;

namespace {

TEST(CZodEVIArtTemplate, PerNetworkTextsCarryTheirSentence)
{
    CZodEVIArtTemplate t;
    t.SetPerNetwork(13, 4, "RSX_VOL_FOU", "m³", "Volume de fouille", "Volume total.", "%s\\\\T", "GC");
    ASSERT_EQ(t.TextCount(), 13u);
    EXPECT_EQ(t.TextsOf(0)->description, "Article associé aux réseaux EP.\r\nVolume total.");
    EXPECT_EQ(t.TextsOf(8)->description, "Article associé aux réseaux 'Téléphone'.\r\nVolume total.");
    EXPECT_EQ(t.TextsOf(12)->description, "Volume total.");
    EXPECT_EQ(t.TextsOf(13), nullptr);
    EXPECT_EQ(t.TextsOf(-1), nullptr);

    t.SetPerNetworkEmpty(2, 2, "X", "ml");
    EXPECT_EQ(t.TextCount(), 13u);
    EXPECT_EQ(t.TextsOf(5)->designation, "");
    t.SetSingle(41, 4, "PRJ_VOL_TOT_DBL", "m³", "D", "d", "c", "GC");
    EXPECT_EQ(t.TextCount(), 1u);
    EXPECT_EQ(t.FirstTexts()->numberingPrefix, "GC");
    t.Reset();
    EXPECT_EQ(t.kind, 2);
    EXPECT_EQ(t.nature, 2);
    EXPECT_EQ(t.FirstTexts(), nullptr);
}

TEST(CZodEVIArtTemplate, CopyIsDeep)
{
    CZodEVIArtTemplate a;
    a.SetSingle(30, 2, "RSX_PGN_LIN_3D_%s", "ml", "D", "d", "Fourreau (peigne)", "GC");
    CZodEVIArtTemplate b;
    b.SetPerNetworkEmpty(1, 1, "old", "old");
    b = a;
    a.SetTexts(0, "changé", "", "", "");
    EXPECT_EQ(b.kind, 30);
    EXPECT_EQ(b.TextCount(), 1u);
    EXPECT_EQ(b.FirstTexts()->designation, "D");
}

TEST(CZodEVIArtTemplateArray, OwnershipAndSelection)
{
    CZodEVIArtTemplateArray owning;
    CZodEVIArtTemplate t;
    for (int kind : {0, 5, 0, 7}) {
        t.SetSingle(kind, 2, "", "", "", "", "", "");
        owning.InsertCopyAt(owning.GetSize(), t);
    }
    CZodEVIArtTemplateArray selection;
    selection.SetOwning(false);
    EXPECT_EQ(owning.SelectKind(0, selection), 2);
    EXPECT_EQ(selection[0], owning[0]);
    EXPECT_EQ(selection[1], owning[2]);
    EXPECT_EQ(owning.SelectKind(10, selection), 0);
    EXPECT_EQ(selection.GetSize(), 0);
    owning.SelectKind(7, selection);

    // Replacing an owned element deletes the old one; shrinking deletes the tail.
    t.SetSingle(9, 2, "", "", "", "", "", "");
    owning.InsertCopyAt(1, t);
    EXPECT_EQ(owning[1]->kind, 9);
    owning.SetSize(2);
    EXPECT_EQ(owning.GetSize(), 2);
    EXPECT_EQ(owning[3], nullptr);
    owning.SetSize(3);
    EXPECT_EQ(owning[2], nullptr);
    // The non-owning selection still points at a deleted template; it must only forget it.
    selection.SetSize(0);
}

} // namespace

// The dialog base as a terminal view uses it: where a point falls on a tree's rows,
// scrolling, sorting, the focus order and the radio group.
#include "velhost/dialog.h"

#include <gtest/gtest.h>

#include "velhost/ui.h"

namespace {

VelDialogTemplate Template()
{
    using K = VelControlKind;
    VelDialogTemplate t;
    t.caption = "Essai";
    t.width = 100;
    t.height = 50;
    t.controls = {{10, K::kTree, "Arbre", {0, 0, 50, 40}, false, true, "arbre"},
                  {20, K::kRadio, "Un", {60, 0, 30, 10}, true, true, "un"},
                  {21, K::kRadio, "Deux", {60, 10, 30, 10}, false, false, "deux"},
                  {IDOK, K::kButton, "OK", {60, 30, 20, 10}, false, true, "ok"},
                  {IDCANCEL, K::kButton, "Annuler", {80, 30, 20, 10}, false, true, "annuler"}};
    return t;
}

class TestDialog : public CVelDialog {
public:
    TestDialog() : CVelDialog(Template(), nullptr, nullptr)
    {
        OnCommandMessage(21, BN_CLICKED, [this] { ++modeClicks; });
    }
    void DoDataExchange(CDataExchange* pDX) override
    {
        DDX_Control(pDX, 10, tree);
        DDX_Radio(pDX, 20, mode);
    }
    SECTreeCtrl tree;
    int mode = 0;
    int modeClicks = 0;
};

TEST(SECTreeCtrl, HitTestFollowsRowsIndentAndScrolling)
{
    SECTreeCtrl tree;
    HTREEITEM b = tree.InsertItem("b");
    HTREEITEM a = tree.InsertItem("Éa");
    HTREEITEM child = tree.InsertItem("enfant", b);
    tree.InsertItem("A", b);
    tree.SortChildren(TVI_ROOT);
    EXPECT_EQ(tree.GetRootItem(), b); // "b" < "Éa" ignoring case
    EXPECT_EQ(tree.GetChildItem(b), tree.GetPrevSiblingItem(child));
    tree.Expand(b, TVE_EXPAND);

    const struct {
        CPoint point;
        HTREEITEM item;
        unsigned flags;
    } cases[] = {
        {{1, 0}, b, TVHT_ONITEMICON},         {{4, 0}, b, TVHT_ONITEMLABEL},    {{40, 0}, b, TVHT_ONITEMRIGHT},
        {{2, 1}, nullptr, TVHT_ONITEMINDENT}, {{5, 2}, child, TVHT_ONITEMICON}, {{9, 2}, child, TVHT_ONITEMLABEL},
        {{0, 3}, a, TVHT_ONITEMICON},         {{0, 4}, nullptr, TVHT_NOWHERE},  {{-1, 0}, nullptr, TVHT_NOWHERE},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(testing::Message() << c.point.x << "," << c.point.y);
        unsigned flags = 0;
        HTREEITEM item = tree.HitTest(c.point, &flags);
        if (c.item != nullptr) {
            EXPECT_EQ(item, c.item);
        }
        EXPECT_EQ(flags, c.flags);
    }

    // Two rows shown: bringing the last item into view scrolls, closing "b" scrolls back.
    tree.SetVisibleCount(2);
    tree.EnsureVisible(a);
    EXPECT_EQ(tree.GetVisibleItems(), (std::vector<HTREEITEM>{child, a}));
    unsigned flags = 0;
    EXPECT_EQ(tree.HitTest({0, 1}, &flags), a);
    tree.SelectItem(child);
    tree.Expand(b, TVE_COLLAPSE);
    EXPECT_EQ(tree.GetSelectedItem(), b);
    EXPECT_EQ(tree.GetVisibleItems(), (std::vector<HTREEITEM>{b, a}));
}

TEST(CVelDialog, KeysRadioButtonsAndButtons)
{
    TestDialog dialog;
    ASSERT_TRUE(dialog.StartModal());
    EXPECT_TRUE(dialog.IsDlgButtonChecked(20));
    EXPECT_EQ(dialog.GetFocusId(), 10);
    // Tab: tree, radio group, OK, Cancel, and round again; Shift-Tab goes back.
    std::vector<int> order;
    for (int i = 0; i < 5; ++i) {
        dialog.KeyDown(VK_TAB);
        order.push_back(dialog.GetFocusId());
    }
    EXPECT_EQ(order, (std::vector<int>{20, IDOK, IDCANCEL, 10, 20}));
    dialog.KeyDown(VK_TAB, true);
    EXPECT_EQ(dialog.GetFocusId(), 10);

    dialog.Click(21, {});
    EXPECT_FALSE(dialog.IsDlgButtonChecked(20));
    EXPECT_EQ(dialog.modeClicks, 1);
    EXPECT_EQ(dialog.GetFocusId(), 21);
    dialog.Resize(120, 60);
    EXPECT_EQ(dialog.GetControlRect(10).width, 50); // no rule: the control stays
    dialog.KeyDown(VK_RETURN);                      // not on a button: the default button
    EXPECT_TRUE(dialog.IsEnded());
    EXPECT_EQ(dialog.GetResult(), IDOK);
    EXPECT_EQ(dialog.mode, 1);
}

} // namespace

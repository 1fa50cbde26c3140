// The quantities selection dialog (`DlgMetExpArt`): the projects found in the drawing
// and the articles they bring, both as check trees, the quantity mode, and the estimate
// lines of the checked articles. It knows nothing of drawing: views show it.
#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <string>
#include <unordered_map>
#include <unordered_set>
#include <utility>
#include <vector>

#include "schedule/schedule_store.hpp"
#include "ui/article_filter.hpp"
#include "ui/project_discovery.hpp"
#include "velhost/dialog.h"
#include "zodevi/assoc_line.h"

namespace zodevi {

// The dialog's template and controls.
inline constexpr int IDD_METEXPART = 405;
inline constexpr int IDC_TREE_ARTICLES = 2755;
inline constexpr int IDC_TREE_PROJECTS = 2756;
inline constexpr int IDC_RADIO_SUM = 2761;
inline constexpr int IDC_RADIO_DETAIL = 2762;
inline constexpr int IDC_GROUP_MODE = 2763;

VelDialogTemplate MetExpArtTemplate();

// What the dialog needs of the module around it: the resources its template comes from,
// and the network sizing module's projects of a network (0 when it answers them). The
// currency comes from the schedule's metre module.
struct CZodEVIDialogLinks {
    void* resource = nullptr;
    std::function<std::int32_t(std::string& network, std::vector<std::string>& projects)> projectsOfNetwork;
};

// Check states, stored as an item's data and image alike.
enum : int { kUnchecked = 0, kChecked = 1, kPartlyChecked = 2 };

// Which project items stand for which projects, and which projects are checked.
struct CZodEVIGroupSelection {
    std::unordered_map<HTREEITEM, std::string> itemNames;
    CZodEVINameMap allNames;
    CZodEVINameMap checkedNames;
    void Clear();
};

// The lines of one article leaf. The rebuild keeps the article and its projects; the
// lines are made the first time they are asked for, since most leaves are never checked
// and every click rebuilds the tree.
struct CZodEVILeafLines {
    CZodEVIFilterEntry entry;
    bool perProject = false;
    const std::vector<std::unique_ptr<CZodEVIAssocLine>>& Lines();

private:
    std::vector<std::unique_ptr<CZodEVIAssocLine>> lines_;
    bool built_ = false;
};

class DlgMetExpArt : public CVelDialog {
public:
    // The dialog over a schedule; without one it shows nothing and closes.
    DlgMetExpArt(void* parent, CZodEVIBdr* schedule, CZodEVIDialogLinks links = {});
    ~DlgMetExpArt() override;

    void DoDataExchange(CDataExchange* pDX) override;
    bool PreTranslateMessage(MSG* pMsg) override;
    bool OnInitDialog() override;
    void OnOK() override;
    std::string TreeCaption(int treeId) const override;

    // New copies of the chosen lines, owned by the caller; answers their count.
    int CopySelectedLines(std::vector<std::unique_ptr<CZodEVIAssocLine>>& out) const;

    bool LoadArticleLists();
    void DiscoverProjects();
    void FillProjectTree(int state);
    void RefillArticleTree();
    // Fills the tree under parent with what lies at path; takes the entries' projects.
    void FillArticleLevel(CZodEVIFilterEntryArray& entries, const std::vector<std::string>& path, HTREEITEM parent);
    void SaveCheckedPaths(HTREEITEM item, std::unordered_map<std::string, std::string>& paths) const;
    void RestoreCheckedPaths(HTREEITEM item, const std::unordered_map<std::string, std::string>& paths);
    void OnClickProjects(long* result);
    void OnClickArticles(long* result);
    void OnQuantityMode();
    void CollectCheckedLines(HTREEITEM item);

    int ItemState(const SECTreeCtrl& tree, HTREEITEM item) const;
    void SetItemState(SECTreeCtrl& tree, HTREEITEM item, int state);
    void SetSubtreeState(SECTreeCtrl& tree, HTREEITEM item, int state);
    void UpdateAncestorStates(SECTreeCtrl& tree, HTREEITEM item);
    void UpdateGroupSelection(HTREEITEM item);

    SECTreeCtrl m_treeProjects;
    SECTreeCtrl m_treeArticles;
    int m_nQuantityMode = 0;
    CPoint m_ptClick;
    std::string m_strCurrency = "€";

    std::vector<std::pair<std::string, CZodEVIGroup*>> m_networkGroups;
    CZodEVIArticleList m_roadArticles;
    CZodEVIArticleList m_lumpSumArticles;

    CZodEVIProjectMap m_networks;
    CZodEVIProjectMap m_roadProjects;
    CZodEVIProjectMap m_korvaneProjects;
    CZodEVIProjectMap m_platforms;

    CZodEVIGroupSelection m_networkSelection;
    CZodEVIGroupSelection m_roadSelection;
    CZodEVIGroupSelection m_korvaneSelection;
    CZodEVIGroupSelection m_platformSelection;

    std::unordered_map<HTREEITEM, CZodEVILeafLines> m_itemLines;
    std::vector<CZodEVIAssocLine*> m_selectedLines;

private:
    void OnClick(SECTreeCtrl& tree, long* result);
    HTREEITEM InsertItem(SECTreeCtrl& tree, const std::string& text, HTREEITEM parent, int state);
    void FillArticleNode(CZodEVIFilterEntryArray& entries, const CZodEVIFilterEntryArray::LevelNode& node,
                         HTREEITEM parent);
    // Builds each item's path from its parent's, so a restore never climbs the tree.
    void RestoreCheckedPaths(HTREEITEM item, const std::string& parentPath,
                             const std::unordered_map<std::string, std::string>& paths);
    std::string ItemPath(const SECTreeCtrl& tree, HTREEITEM item) const;
    // Every category's state from its articles, children first.
    void UpdateCategoryStates(HTREEITEM item);
    // What a person looking at the article tree would lose in a rebuild, kept by path:
    // the categories they closed and the item they stood on.
    void SaveClosedPaths(HTREEITEM item, const std::string& parentPath, std::unordered_set<std::string>& closed) const;
    void RestoreClosedPaths(HTREEITEM item, const std::string& parentPath,
                            const std::unordered_set<std::string>& closed);
    HTREEITEM FindArticlePath(const std::vector<std::string>& texts) const;

    CZodEVIBdr* m_bdr;
    CZodEVIDialogLinks m_links;
    // Built once per dialog: the schedule does not change while it is open.
    CZodEVIArticleKeyIndex m_roadKeys;
    std::vector<std::pair<std::string, CZodEVIArticleKeyIndex>> m_networkKeys;
    std::unordered_map<const CZodEVIArticle*, std::size_t> m_positions;
    std::unordered_set<const CZodEVIAssocLine*> m_selectedSet;
};

} // namespace zodevi

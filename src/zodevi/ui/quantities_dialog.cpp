// The quantities selection dialog: its template, the project tree, the check logic of
// both trees, the rebuild of the article tree through the filter, and the result.
#include "ui/quantities_dialog.hpp"

#include <algorithm>

#include "schedule/metre_link.hpp"
#include "text/text.hpp"
#include "velhost/documents.h"
#include "velhost/editor.h"
#include "velhost/ui.h"

namespace zodevi {

namespace {

constexpr const char* kDialogName = "VELANTO - TRAMVRD - ArtFilter";

void ProfileRootKey(std::string& key, const std::string& profile)
{
    key = velProfileRegistryKey(profile);
}

std::string CurrentProfile()
{
    resbuf value;
    if (acedGetVar("CProfile", &value) != RTNORM)
        return {};
    std::string name = velRbText(&value);
    velRbClear(&value);
    return name;
}

std::vector<std::string> SortedNames(const CZodEVIProjectMap& projects)
{
    std::vector<std::string> names;
    for (const auto& entry : projects)
        names.push_back(entry.first);
    std::sort(names.begin(), names.end());
    return names;
}

} // namespace

VelDialogTemplate MetExpArtTemplate()
{
    using K = VelControlKind;
    VelDialogTemplate t;
    t.caption = "Quantités à prendre en compte";
    t.width = 428;
    t.height = 316;
    t.controls = {
        {IDC_TREE_PROJECTS, K::kTree, "Projets", {7, 10, 119, 250}, false, true, "projet"},
        {IDC_TREE_ARTICLES, K::kTree, "Articles", {135, 10, 286, 250}, false, true, "article"},
        {IDC_GROUP_MODE,
         K::kGroupBox,
         "Article comptant les quantités de plusieurs projets",
         {7, 265, 251, 45},
         false,
         false,
         ""},
        {IDC_RADIO_SUM,
         K::kRadio,
         "Afficher la somme des quantités dans l'article",
         {13, 280, 240, 10},
         true,
         true,
         "mode somme"},
        {IDC_RADIO_DETAIL,
         K::kRadio,
         "Détailler les quantités de chaque projet en sous-articles (=> sous-totaux)",
         {13, 295, 240, 10},
         false,
         false,
         "mode détail"},
        {IDOK, K::kButton, "Valider", {271, 292, 70, 17}, false, true, "valider"},
        {IDCANCEL, K::kButton, "Quitter", {351, 292, 70, 17}, false, true, "quitter"},
    };
    return t;
}

const std::vector<std::unique_ptr<CZodEVIAssocLine>>& CZodEVILeafLines::Lines()
{
    if (!built_) {
        double total = 0;
        const CZodEVIArticle* article = nullptr;
        BuildLines(entry, lines_, total, article, perProject);
        built_ = true;
    }
    return lines_;
}

void CZodEVIGroupSelection::Clear()
{
    itemNames.clear();
    allNames.clear();
    checkedNames.clear();
}

DlgMetExpArt::DlgMetExpArt(void* parent, CZodEVIBdr* schedule, CZodEVIDialogLinks links)
    : CVelDialog(MetExpArtTemplate(), parent, links.resource), m_bdr(schedule), m_links(std::move(links))
{
    SetRootKey(&ProfileRootKey, CurrentProfile());
    SetDialogName(kDialogName);
    SetPersistency(false);
    EnableToolTips(false);
    SetResizeBitmap(true);
    OnNotifyMessage(IDC_TREE_PROJECTS, NM_CLICK, [this](long* result) { OnClickProjects(result); });
    OnNotifyMessage(IDC_TREE_ARTICLES, NM_CLICK, [this](long* result) { OnClickArticles(result); });
    OnCommandMessage(IDC_RADIO_SUM, BN_CLICKED, [this] { OnQuantityMode(); });
    OnCommandMessage(IDC_RADIO_DETAIL, BN_CLICKED, [this] { OnQuantityMode(); });
}

DlgMetExpArt::~DlgMetExpArt() = default;

void DlgMetExpArt::DoDataExchange(CDataExchange* pDX)
{
    CVelDialog::DoDataExchange(pDX);
    DDX_Control(pDX, IDC_TREE_PROJECTS, m_treeProjects);
    DDX_Control(pDX, IDC_TREE_ARTICLES, m_treeArticles);
    DDX_Radio(pDX, IDC_RADIO_SUM, m_nQuantityMode);
}

bool DlgMetExpArt::PreTranslateMessage(MSG* pMsg)
{
    // Enter moves the focus as Tab does: it never validates the dialog.
    if (pMsg->message == WM_KEYDOWN && pMsg->wParam == VK_RETURN)
        pMsg->wParam = VK_TAB;
    if (pMsg->message == WM_LBUTTONDOWN)
        m_ptClick = {GET_X_LPARAM(pMsg->lParam), GET_Y_LPARAM(pMsg->lParam)};
    return CVelDialog::PreTranslateMessage(pMsg);
}

bool DlgMetExpArt::OnInitDialog()
{
    CVelDialog::OnInitDialog();
    if (!LoadArticleLists()) {
        PostMessage(WM_CLOSE);
        return false;
    }
    m_treeProjects.SetImageCount(3);
    m_treeArticles.SetImageCount(3);
    m_treeProjects.SetFirstColumnHeading("Projet");
    m_treeProjects.StoreColumnText(true);
    const int width = m_treeArticles.GetClientWidth();
    m_treeArticles.SetFirstColumnHeading("Article");
    m_treeArticles.SetColumnWidth(0, static_cast<int>(width * 0.5));
    m_treeArticles.InsertColumn(1, "Prix unitaire HT", 1, static_cast<int>(width * 0.25));
    m_treeArticles.InsertColumn(2, "Quantité", 1, width - static_cast<int>(width * 0.75));
    m_treeArticles.StoreColumnText(true);

    std::string currency;
    if (BdrMetre().CurrencySymbol(currency) == 0)
        m_strCurrency = currency;

    DiscoverProjects();
    FillProjectTree(kChecked);
    RefillArticleTree();
    m_treeArticles.SelectItem(m_treeArticles.GetRootItem());

    m_resizeInfo.init(this);
    m_resizeInfo.addCtrl(IDC_TREE_PROJECTS, 0, 0, 25, 100);
    m_resizeInfo.addCtrl(IDC_TREE_ARTICLES, 25, 0, 75, 100);
    for (int id : {IDC_GROUP_MODE, IDC_RADIO_SUM, IDC_RADIO_DETAIL})
        m_resizeInfo.addCtrl(id, 0, 100, 0, 0);
    for (int id : {IDOK, IDCANCEL})
        m_resizeInfo.addCtrl(id, 100, 100, 0, 0);

    SetPersistency(true);
    ReadPosition();
    return true;
}

std::string DlgMetExpArt::TreeCaption(int treeId) const
{
    if (treeId == IDC_TREE_ARTICLES)
        return m_nQuantityMode == 1 ? "Articles (détail)" : "Articles (somme)";
    return CVelDialog::TreeCaption(treeId);
}

bool DlgMetExpArt::LoadArticleLists()
{
    m_networkGroups.clear();
    m_roadArticles.clear();
    m_lumpSumArticles.clear();
    m_networkKeys.clear();
    m_positions.clear();
    if (m_bdr == nullptr)
        return false;
    m_bdr->NetworkGroups(m_networkGroups);
    m_bdr->RoadProjectArticles(m_roadArticles);
    m_bdr->NonGraphicArticles(m_lumpSumArticles, true);
    m_roadKeys.Build(m_roadArticles);
    for (const auto& [network, group] : m_networkGroups) {
        m_networkKeys.emplace_back(network, CZodEVIArticleKeyIndex());
        m_networkKeys.back().second.Build(*group);
    }
    m_bdr->ArticleIndexMap(m_positions);
    return !m_networkGroups.empty() || !m_roadArticles.empty() || !m_lumpSumArticles.empty();
}

void DlgMetExpArt::DiscoverProjects()
{
    DiscoverProjectsIn(acdbHostApplicationServices()->workingDatabase(),
                       {&m_networks, &m_roadProjects, &m_korvaneProjects, &m_platforms});
}

HTREEITEM DlgMetExpArt::InsertItem(SECTreeCtrl& tree, const std::string& text, HTREEITEM parent, int state)
{
    HTREEITEM item = tree.InsertItem(text, parent);
    SetItemState(tree, item, state);
    return item;
}

int DlgMetExpArt::ItemState(const SECTreeCtrl& tree, HTREEITEM item) const
{
    return static_cast<int>(tree.GetItemData(item));
}

void DlgMetExpArt::SetItemState(SECTreeCtrl& tree, HTREEITEM item, int state)
{
    tree.SetItemImage(item, state, state);
    tree.SetItemData(item, static_cast<std::uint32_t>(state));
}

void DlgMetExpArt::FillProjectTree(int state)
{
    m_treeProjects.DeleteAllItems();
    for (CZodEVIGroupSelection* selection :
         {&m_networkSelection, &m_roadSelection, &m_korvaneSelection, &m_platformSelection})
        selection->Clear();

    const struct {
        CZodEVIProjectMap* projects;
        CZodEVIGroupSelection* selection;
        const char* label;
    } groups[] = {
        {&m_roadProjects, &m_roadSelection, "Projets routiers"},
        {&m_korvaneProjects, &m_korvaneSelection, "Projets Korvane"},
        {&m_platforms, &m_platformSelection, "Plates-formes"},
    };
    for (const auto& group : groups) {
        const std::vector<std::string> names = SortedNames(*group.projects);
        if (names.empty())
            continue;
        HTREEITEM parent = InsertItem(m_treeProjects, group.label, TVI_ROOT, state);
        for (const std::string& name : names) {
            HTREEITEM item = InsertItem(m_treeProjects, name, parent, state);
            group.selection->itemNames[item] = name;
            group.selection->allNames[name] = name;
            if (state == kChecked)
                group.selection->checkedNames[name] = name;
        }
        m_treeProjects.SortChildren(parent);
        m_treeProjects.Expand(parent, TVE_EXPAND);
    }

    std::vector<std::string> networks;
    for (const auto& entry : m_networkGroups)
        networks.push_back(entry.first);
    std::sort(networks.begin(), networks.end());
    for (std::string network : networks) {
        std::vector<std::string> projects;
        if (!m_links.projectsOfNetwork || m_links.projectsOfNetwork(network, projects) != 0)
            continue;
        std::vector<std::string> kept;
        for (const std::string& project : projects)
            if (m_networks.Find(project) != nullptr)
                kept.push_back(project);
        if (kept.empty())
            continue;
        HTREEITEM parent = InsertItem(m_treeProjects, network, TVI_ROOT, state);
        for (const std::string& project : kept) {
            HTREEITEM item = InsertItem(m_treeProjects, project, parent, state);
            m_networkSelection.itemNames[item] = project;
            m_networkSelection.allNames[project] = network;
            if (state == kChecked)
                m_networkSelection.checkedNames[project] = network;
        }
        m_treeProjects.SortChildren(parent);
        m_treeProjects.Expand(parent, TVE_EXPAND);
    }
}

void DlgMetExpArt::RefillArticleTree()
{
    std::unordered_map<std::string, std::string> remembered;
    std::unordered_set<std::string> closed;
    for (HTREEITEM root = m_treeArticles.GetRootItem(); root != nullptr;
         root = m_treeArticles.GetNextSiblingItem(root)) {
        SaveCheckedPaths(root, remembered);
        SaveClosedPaths(root, {}, closed);
    }
    std::vector<std::string> selectedPath;
    for (HTREEITEM item = m_treeArticles.GetSelectedItem(); item != nullptr; item = m_treeArticles.GetParentItem(item))
        selectedPath.insert(selectedPath.begin(), m_treeArticles.GetItemText(item));
    const int scrolled = m_treeArticles.GetScrollPos();
    m_treeArticles.DeleteAllItems();
    m_itemLines.clear();

    CZodEVIFilterInputs inputs;
    inputs.networkGroups = &m_networkGroups;
    inputs.networkKeys = &m_networkKeys;
    inputs.roadArticles = &m_roadArticles;
    inputs.roadKeys = &m_roadKeys;
    inputs.lumpSumArticles = &m_lumpSumArticles;
    inputs.projects = {&m_networks, &m_roadProjects, &m_korvaneProjects, &m_platforms};
    inputs.checkedNetworks = &m_networkSelection.checkedNames;
    inputs.checkedRoadProjects = &m_roadSelection.checkedNames;
    inputs.checkedKorvaneProjects = &m_korvaneSelection.checkedNames;
    inputs.checkedPlatforms = &m_platformSelection.checkedNames;
    CZodEVIFilterEntryArray entries;
    CollectEntries(inputs, entries);
    SortEntries(entries, m_positions);
    m_itemLines.reserve(entries.GetSize());
    FillArticleLevel(entries, {}, TVI_ROOT);

    for (HTREEITEM root = m_treeArticles.GetRootItem(); root != nullptr; root = m_treeArticles.GetNextSiblingItem(root))
        RestoreCheckedPaths(root, remembered);
    for (HTREEITEM root = m_treeArticles.GetRootItem(); root != nullptr;
         root = m_treeArticles.GetNextSiblingItem(root)) {
        UpdateCategoryStates(root);
        if (!closed.empty())
            RestoreClosedPaths(root, {}, closed);
    }
    m_treeArticles.SetScrollPos(scrolled);
    if (HTREEITEM selected = FindArticlePath(selectedPath)) {
        m_treeArticles.SelectItem(selected);
        m_treeArticles.EnsureVisible(selected);
    }
}

void DlgMetExpArt::SaveClosedPaths(HTREEITEM item, const std::string& parentPath,
                                   std::unordered_set<std::string>& closed) const
{
    if (!m_treeArticles.ItemHasChildren(item))
        return;
    const std::string path = parentPath + "\\" + m_treeArticles.GetItemText(item);
    if (!m_treeArticles.IsExpanded(item))
        closed.insert(path);
    for (HTREEITEM child = m_treeArticles.GetChildItem(item); child != nullptr;
         child = m_treeArticles.GetNextSiblingItem(child))
        SaveClosedPaths(child, path, closed);
}

void DlgMetExpArt::RestoreClosedPaths(HTREEITEM item, const std::string& parentPath,
                                      const std::unordered_set<std::string>& closed)
{
    if (!m_treeArticles.ItemHasChildren(item))
        return;
    const std::string path = parentPath + "\\" + m_treeArticles.GetItemText(item);
    if (closed.count(path) != 0)
        m_treeArticles.Expand(item, TVE_COLLAPSE);
    for (HTREEITEM child = m_treeArticles.GetChildItem(item); child != nullptr;
         child = m_treeArticles.GetNextSiblingItem(child))
        RestoreClosedPaths(child, path, closed);
}

HTREEITEM DlgMetExpArt::FindArticlePath(const std::vector<std::string>& texts) const
{
    // The deepest item that still stands on the path: a leaf that left the tree leaves
    // the selection on its category.
    HTREEITEM found = nullptr;
    HTREEITEM level = m_treeArticles.GetRootItem();
    for (const std::string& text : texts) {
        HTREEITEM match = level;
        while (match != nullptr && m_treeArticles.GetItemText(match) != text)
            match = m_treeArticles.GetNextSiblingItem(match);
        if (match == nullptr)
            break;
        found = match;
        level = m_treeArticles.GetChildItem(match);
    }
    return found;
}

void DlgMetExpArt::FillArticleLevel(CZodEVIFilterEntryArray& entries, const std::vector<std::string>& path,
                                    HTREEITEM parent)
{
    if (const CZodEVIFilterEntryArray::LevelNode* node = entries.NodeOf(path))
        FillArticleNode(entries, *node, parent);
}

void DlgMetExpArt::FillArticleNode(CZodEVIFilterEntryArray& entries, const CZodEVIFilterEntryArray::LevelNode& node,
                                   HTREEITEM parent)
{
    for (std::size_t i = 0; i < node.subLevels.size(); ++i) {
        HTREEITEM item = InsertItem(m_treeArticles, node.subLevels[i], parent, kUnchecked);
        FillArticleNode(entries, entries.Node(node.children[i]), item);
    }
    if (!node.subLevels.empty())
        m_treeArticles.Expand(parent, TVE_EXPAND);
    if (node.entries.empty())
        return;
    // Each leaf is its own entry's, even when two articles of one level share a
    // designation (their nature levels are not shown).
    for (CZodEVIFilterEntry* entry : node.entries) {
        HTREEITEM leaf = InsertItem(m_treeArticles, entry->article->designation, parent, kUnchecked);
        if (entry->projects.empty())
            continue;
        const CZodEVIArticle& article = *entry->article;
        m_treeArticles.SetItemText(leaf, 1, PriceColumnText(article, m_strCurrency));
        m_treeArticles.SetItemText(leaf, 2, QuantityColumnText(EntryTotal(*entry), article.unit));
        CZodEVILeafLines& lines = m_itemLines[leaf];
        lines.entry.article = entry->article;
        lines.entry.projects = std::move(entry->projects);
        lines.perProject = m_nQuantityMode == 1;
    }
    m_treeArticles.Expand(parent, TVE_EXPAND);
}

std::string DlgMetExpArt::ItemPath(const SECTreeCtrl& tree, HTREEITEM item) const
{
    std::vector<std::string> texts;
    for (; item != nullptr; item = tree.GetParentItem(item))
        texts.insert(texts.begin(), tree.GetItemText(item));
    return JoinStrings(texts, "\\");
}

void DlgMetExpArt::SaveCheckedPaths(HTREEITEM item, std::unordered_map<std::string, std::string>& paths) const
{
    if (m_treeArticles.ItemHasChildren(item)) {
        for (HTREEITEM child = m_treeArticles.GetChildItem(item); child != nullptr;
             child = m_treeArticles.GetNextSiblingItem(child))
            SaveCheckedPaths(child, paths);
        return;
    }
    if (ItemState(m_treeArticles, item) == kChecked)
        paths[ItemPath(m_treeArticles, item)] = FormatInt(1);
}

void DlgMetExpArt::RestoreCheckedPaths(HTREEITEM item, const std::unordered_map<std::string, std::string>& paths)
{
    if (paths.empty())
        return;
    const HTREEITEM parent = m_treeArticles.GetParentItem(item);
    RestoreCheckedPaths(item, parent ? ItemPath(m_treeArticles, parent) : std::string(), paths);
}

void DlgMetExpArt::RestoreCheckedPaths(HTREEITEM item, const std::string& parentPath,
                                       const std::unordered_map<std::string, std::string>& paths)
{
    const std::string path = parentPath.empty() && m_treeArticles.GetParentItem(item) == nullptr
                                 ? m_treeArticles.GetItemText(item)
                                 : parentPath + "\\" + m_treeArticles.GetItemText(item);
    if (!m_treeArticles.ItemHasChildren(item)) {
        if (paths.find(path) != paths.end())
            SetItemState(m_treeArticles, item, kChecked);
        return;
    }
    for (HTREEITEM child = m_treeArticles.GetChildItem(item); child != nullptr;
         child = m_treeArticles.GetNextSiblingItem(child))
        RestoreCheckedPaths(child, path, paths);
}

void DlgMetExpArt::UpdateCategoryStates(HTREEITEM item)
{
    // Once, from the leaves up: the same states as updating the ancestors of every
    // leaf in turn, without recounting a category's children once per leaf.
    if (!m_treeArticles.ItemHasChildren(item))
        return;
    int n = 0, c1 = 0, c2 = 0;
    for (HTREEITEM child = m_treeArticles.GetChildItem(item); child != nullptr;
         child = m_treeArticles.GetNextSiblingItem(child)) {
        UpdateCategoryStates(child);
        const int state = ItemState(m_treeArticles, child);
        ++n;
        c1 += state == kChecked;
        c2 += state == kPartlyChecked;
    }
    SetItemState(m_treeArticles, item, c1 == 0 && c2 == 0 ? kUnchecked : c1 == n ? kChecked : kPartlyChecked);
}

void DlgMetExpArt::OnClickProjects(long* result)
{
    OnClick(m_treeProjects, result);
}

void DlgMetExpArt::OnClickArticles(long* result)
{
    OnClick(m_treeArticles, result);
}

void DlgMetExpArt::OnClick(SECTreeCtrl& tree, long* result)
{
    *result = 0;
    unsigned flags = 0;
    HTREEITEM item = tree.HitTest(m_ptClick, &flags);
    if (item == nullptr || (flags & TVHT_ONITEMICON) == 0)
        return;
    const int state = ItemState(tree, item);
    const int next = state == kUnchecked || state == kPartlyChecked ? kChecked : kUnchecked;
    SetItemState(tree, item, next);
    const bool projects = &tree == &m_treeProjects;
    if (projects)
        UpdateGroupSelection(item);
    if (tree.ItemHasChildren(item)) {
        SetSubtreeState(tree, item, next);
        tree.Expand(item, TVE_EXPAND);
    }
    UpdateAncestorStates(tree, item);
    if (projects)
        RefillArticleTree();
    UpdateData(true);
}

void DlgMetExpArt::UpdateGroupSelection(HTREEITEM item)
{
    for (CZodEVIGroupSelection* selection :
         {&m_networkSelection, &m_roadSelection, &m_korvaneSelection, &m_platformSelection}) {
        const auto found = selection->itemNames.find(item);
        if (found == selection->itemNames.end())
            continue;
        const std::string& name = found->second;
        switch (ItemState(m_treeProjects, item)) {
        case kChecked:
            if (const auto all = selection->allNames.find(name); all != selection->allNames.end())
                selection->checkedNames[name] = all->second;
            break;
        case kUnchecked:
            selection->checkedNames.erase(name);
            break;
        default:
            break;
        }
        return;
    }
}

void DlgMetExpArt::SetSubtreeState(SECTreeCtrl& tree, HTREEITEM item, int state)
{
    for (HTREEITEM child = tree.GetChildItem(item); child != nullptr; child = tree.GetNextSiblingItem(child)) {
        SetItemState(tree, child, state);
        if (&tree == &m_treeProjects)
            UpdateGroupSelection(child);
        if (tree.ItemHasChildren(child))
            SetSubtreeState(tree, child, state);
    }
}

void DlgMetExpArt::UpdateAncestorStates(SECTreeCtrl& tree, HTREEITEM item)
{
    for (HTREEITEM parent = tree.GetParentItem(item); parent != nullptr; parent = tree.GetParentItem(parent)) {
        int n = 0, c1 = 0, c2 = 0;
        for (HTREEITEM child = tree.GetChildItem(parent); child != nullptr; child = tree.GetNextSiblingItem(child)) {
            const int state = ItemState(tree, child);
            ++n;
            c1 += state == kChecked;
            c2 += state == kPartlyChecked;
        }
        SetItemState(tree, parent, c1 == 0 && c2 == 0 ? kUnchecked : c1 == n ? kChecked : kPartlyChecked);
        if (&tree == &m_treeProjects)
            UpdateGroupSelection(parent);
    }
}

void DlgMetExpArt::OnQuantityMode()
{
    UpdateData(true);
    RefillArticleTree();
}

void DlgMetExpArt::OnOK()
{
    UpdateData(true);
    m_selectedLines.clear();
    m_selectedSet.clear();
    for (HTREEITEM root = m_treeArticles.GetRootItem(); root != nullptr; root = m_treeArticles.GetNextSiblingItem(root))
        CollectCheckedLines(root);
    CVelDialog::OnOK();
}

void DlgMetExpArt::CollectCheckedLines(HTREEITEM item)
{
    if (ItemState(m_treeArticles, item) == kChecked) {
        const auto found = m_itemLines.find(item);
        if (found != m_itemLines.end())
            for (const auto& line : found->second.Lines())
                if (line != nullptr && m_selectedSet.insert(line.get()).second)
                    m_selectedLines.push_back(line.get());
    }
    for (HTREEITEM child = m_treeArticles.GetChildItem(item); child != nullptr;
         child = m_treeArticles.GetNextSiblingItem(child))
        CollectCheckedLines(child);
}

int DlgMetExpArt::CopySelectedLines(std::vector<std::unique_ptr<CZodEVIAssocLine>>& out) const
{
    out.clear();
    for (const CZodEVIAssocLine* line : m_selectedLines)
        if (line != nullptr)
            out.push_back(std::make_unique<CZodEVIAssocLine>(*line));
    return static_cast<int>(out.size());
}

} // namespace zodevi

// The dialog base, its check-tree control, data exchange and resize rules; DoModal hands
// the dialog to the user-interface back-end, whose default is the line view.
#include "velhost/dialog.h"

#include <algorithm>
#include <charconv>

#include "text/text.hpp"
#include "velhost/profile.h"
#include "velhost/ui.h"

struct VelTreeItem {
    std::string text;
    std::vector<std::string> columns; // column 1 on
    int image = 0;
    int selectedImage = 0;
    std::uint32_t data = 0;
    VelTreeItem* parent = nullptr;
    std::vector<VelTreeItem*> children;
    std::size_t position = 0; // in the parent's children (or the root level)
    bool expanded = false;
};

const VelDialogControl* VelDialogTemplate::Find(int id) const
{
    for (const VelDialogControl& control : controls)
        if (control.id == id)
            return &control;
    return nullptr;
}

// ---- tree ----

SECTreeCtrl::SECTreeCtrl()
{
    columns_.push_back({});
}

SECTreeCtrl::~SECTreeCtrl() = default;

void SECTreeCtrl::SetFirstColumnHeading(const std::string& heading)
{
    columns_[0].heading = heading;
}

void SECTreeCtrl::SetColumnWidth(int column, int width)
{
    if (column >= 0 && static_cast<std::size_t>(column) < columns_.size())
        columns_[column].width = width;
}

int SECTreeCtrl::InsertColumn(int column, const std::string& heading, int format, int width)
{
    if (column < 1)
        return -1;
    const std::size_t at = std::min(columns_.size(), static_cast<std::size_t>(column));
    columns_.insert(columns_.begin() + static_cast<std::ptrdiff_t>(at), Column{heading, format, width});
    return static_cast<int>(at);
}

HTREEITEM SECTreeCtrl::InsertItem(const std::string& text, HTREEITEM parent)
{
    if (count_ == blocks_.size() * kBlock)
        blocks_.push_back(std::make_unique<VelTreeItem[]>(kBlock));
    VelTreeItem* item = &blocks_[count_ / kBlock][count_ % kBlock];
    ++count_;
    // A reused item keeps the room of its texts and lists.
    item->text = text;
    item->columns.clear();
    item->image = item->selectedImage = 0;
    item->data = 0;
    item->parent = parent;
    item->children.clear();
    item->expanded = false;
    std::vector<VelTreeItem*>& siblings = parent ? parent->children : roots_;
    item->position = siblings.size();
    siblings.push_back(item);
    return item;
}

bool SECTreeCtrl::DeleteAllItems()
{
    roots_.clear();
    count_ = 0;
    selected_ = nullptr;
    topRow_ = 0;
    return true;
}

std::string SECTreeCtrl::GetItemText(HTREEITEM item) const
{
    return item ? item->text : std::string();
}

bool SECTreeCtrl::SetItemText(HTREEITEM item, int column, const std::string& text)
{
    if (item == nullptr || column < 0 || static_cast<std::size_t>(column) >= columns_.size())
        return false;
    if (column == 0) {
        item->text = text;
        return true;
    }
    if (!storeColumnText_)
        return false;
    if (item->columns.size() < static_cast<std::size_t>(column))
        item->columns.resize(static_cast<std::size_t>(column));
    item->columns[static_cast<std::size_t>(column) - 1] = text;
    return true;
}

std::string SECTreeCtrl::GetItemText(HTREEITEM item, int column) const
{
    if (item == nullptr || column < 0)
        return {};
    if (column == 0)
        return item->text;
    const std::size_t index = static_cast<std::size_t>(column) - 1;
    return index < item->columns.size() ? item->columns[index] : std::string();
}

bool SECTreeCtrl::SetItemImage(HTREEITEM item, int image, int selectedImage)
{
    if (item == nullptr)
        return false;
    item->image = image;
    item->selectedImage = selectedImage;
    return true;
}

bool SECTreeCtrl::GetItemImage(HTREEITEM item, int& image, int& selectedImage) const
{
    if (item == nullptr)
        return false;
    image = item->image;
    selectedImage = item->selectedImage;
    return true;
}

bool SECTreeCtrl::SetItemData(HTREEITEM item, std::uint32_t data)
{
    if (item == nullptr)
        return false;
    item->data = data;
    return true;
}

std::uint32_t SECTreeCtrl::GetItemData(HTREEITEM item) const
{
    return item ? item->data : 0;
}

HTREEITEM SECTreeCtrl::GetRootItem() const
{
    return roots_.empty() ? nullptr : roots_.front();
}

HTREEITEM SECTreeCtrl::GetChildItem(HTREEITEM item) const
{
    const std::vector<VelTreeItem*>& children = item ? item->children : roots_;
    return children.empty() ? nullptr : children.front();
}

HTREEITEM SECTreeCtrl::GetNextSiblingItem(HTREEITEM item) const
{
    if (item == nullptr)
        return nullptr;
    const std::vector<VelTreeItem*>& siblings = item->parent ? item->parent->children : roots_;
    return item->position + 1 < siblings.size() ? siblings[item->position + 1] : nullptr;
}

HTREEITEM SECTreeCtrl::GetPrevSiblingItem(HTREEITEM item) const
{
    if (item == nullptr || item->position == 0)
        return nullptr;
    const std::vector<VelTreeItem*>& siblings = item->parent ? item->parent->children : roots_;
    return siblings[item->position - 1];
}

HTREEITEM SECTreeCtrl::GetParentItem(HTREEITEM item) const
{
    return item ? item->parent : nullptr;
}

bool SECTreeCtrl::ItemHasChildren(HTREEITEM item) const
{
    return item != nullptr && !item->children.empty();
}

int SECTreeCtrl::GetItemLevel(HTREEITEM item) const
{
    int level = 0;
    for (HTREEITEM p = item ? item->parent : nullptr; p != nullptr; p = p->parent)
        ++level;
    return level;
}

bool SECTreeCtrl::Expand(HTREEITEM item, unsigned code)
{
    if (item == nullptr)
        return false;
    switch (code) {
    case TVE_EXPAND:
        item->expanded = true;
        break;
    case TVE_COLLAPSE:
        item->expanded = false;
        break;
    case TVE_TOGGLE:
        item->expanded = !item->expanded;
        break;
    default:
        return false;
    }
    // The selection never hides inside a closed item.
    for (HTREEITEM p = selected_ ? selected_->parent : nullptr; p != nullptr; p = p->parent)
        if (!p->expanded)
            selected_ = p;
    return true;
}

bool SECTreeCtrl::IsExpanded(HTREEITEM item) const
{
    return item != nullptr && item->expanded;
}

bool SECTreeCtrl::SortChildren(HTREEITEM item)
{
    std::vector<VelTreeItem*>& children = item ? item->children : roots_;
    std::stable_sort(children.begin(), children.end(),
                     [](const VelTreeItem* a, const VelTreeItem* b) { return CompareNoCase(a->text, b->text) < 0; });
    for (std::size_t i = 0; i < children.size(); ++i) {
        children[i]->position = i;
        SortChildren(children[i]);
    }
    return true;
}

bool SECTreeCtrl::SelectItem(HTREEITEM item)
{
    selected_ = item;
    return true;
}

bool SECTreeCtrl::EnsureVisible(HTREEITEM item)
{
    if (item == nullptr)
        return false;
    for (HTREEITEM p = item->parent; p != nullptr; p = p->parent)
        p->expanded = true;
    const int row = RowOf(item);
    if (visibleRows_ > 0) {
        if (row < topRow_)
            topRow_ = row;
        else if (row >= topRow_ + visibleRows_)
            topRow_ = row - visibleRows_ + 1;
    }
    return true;
}

void SECTreeCtrl::SetVisibleCount(int rows)
{
    visibleRows_ = std::max(0, rows);
}

void SECTreeCtrl::SetScrollPos(int row)
{
    std::vector<HTREEITEM> rows;
    VisibleRows(rows);
    const int last = visibleRows_ > 0 ? std::max(0, static_cast<int>(rows.size()) - visibleRows_) : 0;
    topRow_ = std::clamp(row, 0, last);
}

void SECTreeCtrl::VisibleRows(std::vector<HTREEITEM>& rows) const
{
    std::vector<HTREEITEM> pending(roots_.rbegin(), roots_.rend());
    while (!pending.empty()) {
        HTREEITEM item = pending.back();
        pending.pop_back();
        rows.push_back(item);
        if (item->expanded)
            pending.insert(pending.end(), item->children.rbegin(), item->children.rend());
    }
}

int SECTreeCtrl::RowOf(HTREEITEM item) const
{
    std::vector<HTREEITEM> rows;
    VisibleRows(rows);
    const auto found = std::find(rows.begin(), rows.end(), item);
    return found == rows.end() ? -1 : static_cast<int>(found - rows.begin());
}

std::vector<HTREEITEM> SECTreeCtrl::GetVisibleItems(bool all) const
{
    std::vector<HTREEITEM> rows;
    VisibleRows(rows);
    if (all)
        return rows;
    // Closing items may have left the first row past the end: the last page shows then.
    const std::size_t last = visibleRows_ > 0 && rows.size() > static_cast<std::size_t>(visibleRows_)
                                 ? rows.size() - static_cast<std::size_t>(visibleRows_)
                                 : 0;
    const std::size_t first = std::min(last, static_cast<std::size_t>(topRow_));
    std::size_t end = rows.size();
    if (visibleRows_ > 0)
        end = std::min(end, first + static_cast<std::size_t>(visibleRows_));
    return std::vector<HTREEITEM>(rows.begin() + static_cast<std::ptrdiff_t>(first),
                                  rows.begin() + static_cast<std::ptrdiff_t>(end));
}

HTREEITEM SECTreeCtrl::HitTest(CPoint point, unsigned* flags) const
{
    const auto answer = [&](HTREEITEM item, unsigned f) {
        if (flags != nullptr)
            *flags = f;
        return item;
    };
    const int rowHeight = std::max(1, metrics_.rowHeight);
    if (point.y < 0 || point.x < 0)
        return answer(nullptr, TVHT_NOWHERE);
    const std::vector<HTREEITEM> rows = GetVisibleItems();
    const std::size_t row = static_cast<std::size_t>(point.y / rowHeight);
    if (row >= rows.size())
        return answer(nullptr, TVHT_NOWHERE);
    HTREEITEM item = rows[row];
    const int imageX = metrics_.origin + GetItemLevel(item) * metrics_.indent;
    if (point.x < imageX) {
        const bool onButton = !item->children.empty() && point.x >= imageX - metrics_.indent;
        return answer(item, onButton ? TVHT_ONITEMBUTTON : TVHT_ONITEMINDENT);
    }
    if (point.x < imageX + metrics_.imageWidth)
        return answer(item, TVHT_ONITEMICON);
    if (point.x < imageX + metrics_.imageWidth + 1 + static_cast<int>(CharCount(item->text)))
        return answer(item, TVHT_ONITEMLABEL);
    return answer(item, TVHT_ONITEMRIGHT);
}

bool SECTreeCtrl::GetItemRect(HTREEITEM item, CRect& rect, VelTreePart part) const
{
    const std::vector<HTREEITEM> rows = GetVisibleItems();
    const auto found = std::find(rows.begin(), rows.end(), item);
    if (item == nullptr || found == rows.end())
        return false;
    const int rowHeight = std::max(1, metrics_.rowHeight);
    const int y = static_cast<int>(found - rows.begin()) * rowHeight;
    const int imageX = metrics_.origin + GetItemLevel(item) * metrics_.indent;
    switch (part) {
    case VelTreePart::kRow:
        rect = {0, y, imageX + metrics_.imageWidth + 1 + static_cast<int>(CharCount(item->text)), rowHeight};
        break;
    case VelTreePart::kImage:
        rect = {imageX, y, metrics_.imageWidth, rowHeight};
        break;
    case VelTreePart::kLabel:
        rect = {imageX + metrics_.imageWidth, y, 1 + static_cast<int>(CharCount(item->text)), rowHeight};
        break;
    }
    return true;
}

// ---- data exchange ----

void DDX_Control(CDataExchange* pDX, int id, SECTreeCtrl& tree)
{
    CVelDialog& dialog = *pDX->m_pDlgWnd;
    const VelDialogControl* control = dialog.GetTemplate().Find(id);
    if (control == nullptr || control->kind != VelControlKind::kTree || (tree.id_ != 0 && tree.id_ != id)) {
        pDX->m_bFailed = true;
        return;
    }
    if (tree.id_ == 0) {
        tree.id_ = id;
        // Pixels of the dialog's 8-point font: 4 dialog units are 6 pixels; less the border.
        tree.clientWidth_ = control->rect.width * 3 / 2 - 4;
        dialog.trees_.emplace_back(id, &tree);
    }
}

namespace {

// The radio buttons of the group that starts at firstId, in template order.
std::vector<int> RadioGroup(const VelDialogTemplate& dialogTemplate, int firstId)
{
    std::vector<int> group;
    bool in = false;
    for (const VelDialogControl& control : dialogTemplate.controls) {
        if (control.id == firstId)
            in = true;
        else if (in && (control.kind != VelControlKind::kRadio || control.firstOfGroup))
            break;
        if (in && control.kind == VelControlKind::kRadio)
            group.push_back(control.id);
    }
    return group;
}

// The first radio button of the group holding id.
int GroupStart(const VelDialogTemplate& dialogTemplate, int id)
{
    int start = 0;
    for (const VelDialogControl& control : dialogTemplate.controls) {
        if (control.kind != VelControlKind::kRadio) {
            start = 0;
            continue;
        }
        if (control.firstOfGroup || start == 0)
            start = control.id;
        if (control.id == id)
            return start;
    }
    return 0;
}

} // namespace

void DDX_Radio(CDataExchange* pDX, int firstId, int& value)
{
    CVelDialog& dialog = *pDX->m_pDlgWnd;
    const std::vector<int> group = RadioGroup(dialog.GetTemplate(), firstId);
    if (group.empty()) {
        pDX->m_bFailed = true;
        return;
    }
    if (pDX->m_bSaveAndValidate) {
        value = -1;
        for (std::size_t i = 0; i < group.size(); ++i)
            if (dialog.IsDlgButtonChecked(group[i]))
                value = static_cast<int>(i);
    } else if (value >= 0 && static_cast<std::size_t>(value) < group.size()) {
        dialog.CheckRadioButton(group.front(), group.back(), group[static_cast<std::size_t>(value)]);
    } else {
        dialog.CheckRadioButton(group.front(), group.back(), 0);
    }
}

// ---- resize rules ----

void CVelResizeInfoArray::init(CVelDialog* dialog)
{
    dialog_ = dialog;
    rules_.clear();
    if (dialog != nullptr) {
        width_ = dialog->GetWidth();
        height_ = dialog->GetHeight();
    }
}

void CVelResizeInfoArray::addCtrl(int id, int moveX, int moveY, int growX, int growY)
{
    if (dialog_ == nullptr || dialog_->GetTemplate().Find(id) == nullptr)
        return;
    rules_.push_back({id, moveX, moveY, growX, growY, dialog_->GetControlRect(id)});
}

void CVelResizeInfoArray::Apply(int width, int height)
{
    if (dialog_ == nullptr)
        return;
    const int dx = width - width_;
    const int dy = height - height_;
    const auto& controls = dialog_->GetTemplate().controls;
    for (const Rule& rule : rules_) {
        for (std::size_t i = 0; i < controls.size(); ++i) {
            if (controls[i].id != rule.id)
                continue;
            dialog_->rects_[i] = {rule.origin.x + dx * rule.moveX / 100, rule.origin.y + dy * rule.moveY / 100,
                                  rule.origin.width + dx * rule.growX / 100,
                                  rule.origin.height + dy * rule.growY / 100};
        }
    }
}

// ---- dialog ----

std::string velProfileRegistryKey(const std::string& profile)
{
    return "Software\\Velanto\\Profils\\" + profile;
}

CVelDialog::CVelDialog(VelDialogTemplate dialogTemplate, void* parent, void* resourceInstance)
    : template_(std::move(dialogTemplate)), parent_(parent), resourceInstance_(resourceInstance)
{
    width_ = template_.width;
    height_ = template_.height;
    for (const VelDialogControl& control : template_.controls)
        rects_.push_back(control.rect);
}

CVelDialog::~CVelDialog() = default;

int CVelDialog::DoModal()
{
    return velUI().runDialog(*this);
}

bool CVelDialog::StartModal()
{
    started_ = true;
    ended_ = false;
    result_ = 0;
    if (OnInitDialog() && focus_ == 0) {
        const std::vector<int> order = FocusOrder();
        if (!order.empty())
            focus_ = order.front();
    }
    RunPosted();
    return !ended_;
}

SECTreeCtrl* CVelDialog::GetTree(int id) const
{
    for (const auto& [treeId, tree] : trees_)
        if (treeId == id)
            return tree;
    return nullptr;
}

bool CVelDialog::IsDlgButtonChecked(int id) const
{
    return std::find(checkedRadios_.begin(), checkedRadios_.end(), id) != checkedRadios_.end();
}

bool CVelDialog::SetFocusId(int id)
{
    if (template_.Find(id) == nullptr)
        return false;
    focus_ = id;
    return true;
}

CRect CVelDialog::GetControlRect(int id) const
{
    for (std::size_t i = 0; i < template_.controls.size(); ++i)
        if (template_.controls[i].id == id)
            return rects_[i];
    return {};
}

void CVelDialog::Resize(int width, int height)
{
    width_ = width;
    height_ = height;
    m_resizeInfo.Apply(width, height);
}

std::string CVelDialog::TreeCaption(int treeId) const
{
    const VelDialogControl* control = template_.Find(treeId);
    return control ? control->text : std::string();
}

void CVelDialog::Click(int id, CPoint point)
{
    const VelDialogControl* control = template_.Find(id);
    if (ended_ || control == nullptr)
        return;
    MSG msg{WM_LBUTTONDOWN, id, 0, MAKELPARAM(point.x, point.y), false};
    if (!PreTranslateMessage(&msg)) {
        switch (control->kind) {
        case VelControlKind::kTree:
            focus_ = id;
            if (SECTreeCtrl* tree = GetTree(id)) {
                unsigned flags = 0;
                if (HTREEITEM item = tree->HitTest(point, &flags)) {
                    // An item's button opens or closes it and leaves the selection where it is.
                    if (flags & TVHT_ONITEMBUTTON)
                        tree->Expand(item, TVE_TOGGLE);
                    else
                        tree->SelectItem(item);
                }
            }
            Notify(id, NM_CLICK);
            break;
        case VelControlKind::kRadio:
            focus_ = id;
            for (int member : RadioGroup(template_, GroupStart(template_, id)))
                std::erase(checkedRadios_, member);
            checkedRadios_.push_back(id);
            Command(id, BN_CLICKED);
            break;
        case VelControlKind::kButton:
            focus_ = id;
            Command(id, BN_CLICKED);
            break;
        case VelControlKind::kGroupBox:
            break;
        }
    }
    RunPosted();
}

void CVelDialog::KeyDown(unsigned virtualKey, bool shift)
{
    if (ended_)
        return;
    MSG msg{WM_KEYDOWN, focus_, virtualKey, 0, shift};
    if (!PreTranslateMessage(&msg)) {
        const VelDialogControl* focused = template_.Find(focus_);
        const VelControlKind kind = focused ? focused->kind : VelControlKind::kGroupBox;
        switch (msg.wParam) {
        case VK_TAB:
            MoveFocus(msg.shift);
            break;
        case VK_ESCAPE:
            Command(IDCANCEL, BN_CLICKED);
            break;
        case VK_RETURN:
            Command(kind == VelControlKind::kButton ? focus_ : IDOK, BN_CLICKED);
            break;
        case VK_SPACE:
            if (kind == VelControlKind::kButton || kind == VelControlKind::kRadio)
                Click(focus_, {});
            break;
        case VK_LEFT:
        case VK_UP:
        case VK_RIGHT:
        case VK_DOWN:
            if (kind == VelControlKind::kRadio) {
                // One tab stop for the group: the arrows choose within it.
                const std::vector<int> group = RadioGroup(template_, GroupStart(template_, focus_));
                const auto at = std::find(group.begin(), group.end(), focus_);
                if (at == group.end())
                    break;
                const std::ptrdiff_t n = static_cast<std::ptrdiff_t>(group.size());
                const std::ptrdiff_t step = msg.wParam == VK_LEFT || msg.wParam == VK_UP ? -1 : 1;
                Click(group[static_cast<std::size_t>(((at - group.begin() + step) % n + n) % n)], {});
            }
            break;
        default:
            break;
        }
    }
    RunPosted();
}

void CVelDialog::Close()
{
    if (ended_)
        return;
    Command(IDCANCEL, BN_CLICKED);
    RunPosted();
}

void CVelDialog::DoDataExchange(CDataExchange*) {}

bool CVelDialog::PreTranslateMessage(MSG*)
{
    return false;
}

bool CVelDialog::OnInitDialog()
{
    UpdateData(false);
    return true;
}

void CVelDialog::OnOK()
{
    if (UpdateData(true))
        EndDialog(IDOK);
}

void CVelDialog::OnCancel()
{
    EndDialog(IDCANCEL);
}

bool CVelDialog::UpdateData(bool saveAndValidate)
{
    CDataExchange exchange(*this, saveAndValidate);
    DoDataExchange(&exchange);
    return !exchange.m_bFailed;
}

void CVelDialog::EndDialog(int result)
{
    ended_ = true;
    result_ = result;
    // What was chosen for a result that counts is what the person wants next time.
    if (result == IDOK)
        WritePosition();
}

void CVelDialog::PostMessage(unsigned message)
{
    posted_.push_back(message);
}

void CVelDialog::CheckRadioButton(int firstId, int lastId, int checkedId)
{
    bool in = false;
    for (const VelDialogControl& control : template_.controls) {
        if (control.id == firstId)
            in = true;
        if (in && control.kind == VelControlKind::kRadio)
            std::erase(checkedRadios_, control.id);
        if (control.id == lastId)
            break;
    }
    if (checkedId != 0)
        checkedRadios_.push_back(checkedId);
}

void CVelDialog::SetRootKey(VelRootKeyCallback callback, const std::string& profile)
{
    rootKey_ = callback;
    profile_ = profile;
}

std::string CVelDialog::ProfileKey() const
{
    std::string key;
    if (rootKey_ != nullptr)
        rootKey_(key, profile_);
    if (key.empty())
        return {};
    return dialogName_.empty() ? key : key + "\\" + dialogName_;
}

namespace {

constexpr const char* kSettingsRoot = "HKEY_CURRENT_USER";

std::string RadioValueName(int firstId)
{
    return "Radio" + std::to_string(firstId);
}

} // namespace

bool CVelDialog::ReadPosition()
{
    if (!persist_ || velUI().isScripted())
        return false;
    const std::string key = ProfileKey();
    if (key.empty())
        return false;
    bool read = false;
    const int focus = focus_;
    for (const VelDialogControl& control : template_.controls) {
        if (control.kind != VelControlKind::kRadio || GroupStart(template_, control.id) != control.id)
            continue;
        const std::vector<int> group = RadioGroup(template_, control.id);
        std::string text;
        if (!velRegQueryValue(kSettingsRoot, key, RadioValueName(control.id), text, 16))
            continue;
        std::size_t index = 0;
        const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), index);
        if (error != std::errc() || end != text.data() + text.size() || index >= group.size())
            continue;
        read = true;
        // A click, so that the dialog follows the choice as it follows the person's.
        if (!IsDlgButtonChecked(group[index]))
            Click(group[index], {});
    }
    focus_ = focus;
    return read;
}

void CVelDialog::WritePosition()
{
    if (!persist_ || velUI().isScripted())
        return;
    const std::string key = ProfileKey();
    if (key.empty())
        return;
    for (const VelDialogControl& control : template_.controls) {
        if (control.kind != VelControlKind::kRadio || GroupStart(template_, control.id) != control.id)
            continue;
        const std::vector<int> group = RadioGroup(template_, control.id);
        // A preference that cannot be kept is not worth a message at the end of a command.
        for (std::size_t i = 0; i < group.size(); ++i)
            if (IsDlgButtonChecked(group[i]))
                velRegSetValue(kSettingsRoot, key, RadioValueName(control.id), std::to_string(i));
    }
}

void CVelDialog::OnNotifyMessage(int id, int code, NotifyHandler handler)
{
    handlers_.push_back({id, code, true, std::move(handler), nullptr});
}

void CVelDialog::OnCommandMessage(int id, int code, CommandHandler handler)
{
    handlers_.push_back({id, code, false, nullptr, std::move(handler)});
}

void CVelDialog::Notify(int id, int code)
{
    for (const Handler& handler : handlers_)
        if (handler.notify && handler.id == id && handler.code == code) {
            long result = 0;
            handler.onNotify(&result);
            return;
        }
}

void CVelDialog::Command(int id, int code)
{
    for (const Handler& handler : handlers_)
        if (!handler.notify && handler.id == id && handler.code == code) {
            handler.onCommand();
            return;
        }
    if (code != BN_CLICKED)
        return;
    if (id == IDOK)
        OnOK();
    else if (id == IDCANCEL)
        OnCancel();
}

void CVelDialog::RunPosted()
{
    while (!posted_.empty() && !ended_) {
        const unsigned message = posted_.front();
        posted_.erase(posted_.begin());
        if (message == WM_CLOSE)
            Command(IDCANCEL, BN_CLICKED);
    }
    posted_.clear();
}

std::vector<int> CVelDialog::FocusOrder() const
{
    std::vector<int> order;
    for (const VelDialogControl& control : template_.controls) {
        if (control.kind == VelControlKind::kRadio) {
            // A group of radio buttons is one stop: its checked button, else its first.
            if (!control.tabStop)
                continue;
            int stop = control.id;
            for (int member : RadioGroup(template_, control.id))
                if (IsDlgButtonChecked(member))
                    stop = member;
            order.push_back(stop);
        } else if (control.tabStop) {
            order.push_back(control.id);
        }
    }
    return order;
}

void CVelDialog::MoveFocus(bool backwards)
{
    const std::vector<int> order = FocusOrder();
    if (order.empty())
        return;
    int current = focus_;
    const VelDialogControl* focused = template_.Find(focus_);
    if (focused != nullptr && focused->kind == VelControlKind::kRadio) {
        const int start = GroupStart(template_, focus_);
        for (int stop : order)
            if (GroupStart(template_, stop) == start && template_.Find(stop)->kind == VelControlKind::kRadio)
                current = stop;
    }
    const auto at = std::find(order.begin(), order.end(), current);
    const std::ptrdiff_t n = static_cast<std::ptrdiff_t>(order.size());
    std::ptrdiff_t index = at == order.end() ? (backwards ? 0 : -1) : at - order.begin();
    index = ((backwards ? index - 1 : index + 1) % n + n) % n;
    focus_ = order[static_cast<std::size_t>(index)];
}

// ---- the user interface's hook ----

int VelUserInterface::runDialog(CVelDialog& dialog)
{
    return velRunDialogLines(dialog, *this);
}

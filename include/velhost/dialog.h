// Dialogs of the stand-in host: the dialog base (template, data exchange, messages,
// focus, resize rules, placement settings), the check-tree control and the contract by
// which a view (the script line view, a full-screen terminal view) shows a dialog and
// turns the user's acts into calls. A dialog never draws; its views read it.
#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <string>
#include <vector>

#pragma GCC visibility push(default)

// ---- messages, as the dialog and its controls exchange them ----

constexpr unsigned WM_CLOSE = 0x0010;
constexpr unsigned WM_KEYDOWN = 0x0100;
constexpr unsigned WM_COMMAND = 0x0111;
constexpr unsigned WM_LBUTTONDOWN = 0x0201;

// Virtual keys a view passes to KeyDown.
constexpr unsigned VK_TAB = 0x09;
constexpr unsigned VK_RETURN = 0x0D;
constexpr unsigned VK_ESCAPE = 0x1B;
constexpr unsigned VK_SPACE = 0x20;
constexpr unsigned VK_LEFT = 0x25;
constexpr unsigned VK_UP = 0x26;
constexpr unsigned VK_RIGHT = 0x27;
constexpr unsigned VK_DOWN = 0x28;

// Notification codes: a click on a tree (NM_CLICK), a button pressed (BN_CLICKED).
constexpr int NM_CLICK = -2;
constexpr int BN_CLICKED = 0;

// One message as PreTranslateMessage sees it. `control` is the id of the control that
// received it (0 for the dialog); for WM_LBUTTONDOWN, lParam holds the point in that
// control's client coordinates, x in its low word and y in its high word, each a signed
// 16-bit value; for WM_KEYDOWN, wParam is the virtual key. `shift` is the Shift key.
struct MSG {
    unsigned message = 0;
    int control = 0;
    std::uintptr_t wParam = 0;
    std::intptr_t lParam = 0;
    bool shift = false;
};

constexpr std::intptr_t MAKELPARAM(int x, int y)
{
    return static_cast<std::intptr_t>(static_cast<std::uint32_t>(static_cast<std::uint16_t>(x)) |
                                      (static_cast<std::uint32_t>(static_cast<std::uint16_t>(y)) << 16));
}
constexpr int GET_X_LPARAM(std::intptr_t lp)
{
    return static_cast<std::int16_t>(lp & 0xFFFF);
}
constexpr int GET_Y_LPARAM(std::intptr_t lp)
{
    return static_cast<std::int16_t>((lp >> 16) & 0xFFFF);
}

struct CPoint {
    int x = 0;
    int y = 0;
};

// Left, top, width, height: dialog units in a template, character cells in a tree's
// client area (see SECTreeCtrl::SetMetrics).
struct CRect {
    int x = 0;
    int y = 0;
    int width = 0;
    int height = 0;
    bool Contains(CPoint p) const { return p.x >= x && p.x < x + width && p.y >= y && p.y < y + height; }
};

// ---- the template ----

enum class VelControlKind { kTree, kGroupBox, kRadio, kButton };

// One control of a template. `scriptName` is the word (or words) by which the script
// line view names it ("projet", "mode somme", "valider"); empty for none.
struct VelDialogControl {
    int id = 0;
    VelControlKind kind = VelControlKind::kButton;
    std::string text;
    CRect rect;
    bool firstOfGroup = false; // a radio button that starts its group
    bool tabStop = false;
    std::string scriptName;
};

struct VelDialogTemplate {
    std::string caption;
    int width = 0; // dialog units
    int height = 0;
    std::vector<VelDialogControl> controls;
    const VelDialogControl* Find(int id) const;
};

// ---- the check-tree control ----

struct VelTreeItem;
using HTREEITEM = VelTreeItem*;
inline HTREEITEM const TVI_ROOT = nullptr;

// Expand codes.
constexpr unsigned TVE_COLLAPSE = 0x1;
constexpr unsigned TVE_EXPAND = 0x2;
constexpr unsigned TVE_TOGGLE = 0x3;

// Hit-test flags: where a point lies on a row.
constexpr unsigned TVHT_NOWHERE = 0x01;
constexpr unsigned TVHT_ONITEMICON = 0x02;   // on the item's image (the check box)
constexpr unsigned TVHT_ONITEMLABEL = 0x04;  // on its text
constexpr unsigned TVHT_ONITEMINDENT = 0x08; // left of the image
constexpr unsigned TVHT_ONITEMBUTTON = 0x10; // the indent slot just left of the image, on an item with children
constexpr unsigned TVHT_ONITEMRIGHT = 0x20;  // right of the text (the columns)

// Parts of a row for GetItemRect.
enum class VelTreePart { kRow, kImage, kLabel };

class CVelDialog;
class CDataExchange;

// A tree of items with a text, further column texts, an image index (the check state:
// 0 unchecked, 1 checked, 2 partly), a 32-bit data value and an expand state.
// Geometry, for hit tests and views: the rows are the items whose ancestors are all
// expanded, in tree order, from the first visible row on; row r lies at y = r * rowHeight;
// an item of level L (0 at the root) has its image at x = origin + L * indent, imageWidth
// wide, then one cell, then its text (one cell per character); the indent cells just left
// of the image of an item with children are its open/close button.
class SECTreeCtrl {
public:
    SECTreeCtrl();
    ~SECTreeCtrl();
    SECTreeCtrl(const SECTreeCtrl&) = delete;
    SECTreeCtrl& operator=(const SECTreeCtrl&) = delete;

    // The dialog control it stands for (set by DDX_Control); 0 before.
    int GetDlgCtrlID() const { return id_; }

    // Columns: the first's heading and width, further ones inserted with a heading, an
    // alignment (0 left, 1 right) and a width; widths are pixels of the original, which a
    // view may scale. StoreColumnText keeps the texts set per item and column.
    struct Column {
        std::string heading;
        int format = 0;
        int width = 0;
    };
    void SetFirstColumnHeading(const std::string& heading);
    void SetColumnWidth(int column, int width);
    int InsertColumn(int column, const std::string& heading, int format, int width);
    const std::vector<Column>& GetColumns() const { return columns_; }
    void StoreColumnText(bool store) { storeColumnText_ = store; }
    // The width the tree's client area had when the dialog opened, in pixels.
    int GetClientWidth() const { return clientWidth_; }
    void SetClientWidth(int width) { clientWidth_ = width; }
    // Number of images of the normal image list (0 without one).
    void SetImageCount(int count) { imageCount_ = count; }
    int GetImageCount() const { return imageCount_; }

    // Items. Insertion is after the parent's last child (TVI_ROOT for the root level).
    HTREEITEM InsertItem(const std::string& text, HTREEITEM parent = TVI_ROOT);
    bool DeleteAllItems();
    std::size_t GetCount() const { return count_; }
    std::string GetItemText(HTREEITEM item) const;
    // Column 0 is the item's text; others need StoreColumnText(true).
    bool SetItemText(HTREEITEM item, int column, const std::string& text);
    std::string GetItemText(HTREEITEM item, int column) const;
    bool SetItemImage(HTREEITEM item, int image, int selectedImage);
    bool GetItemImage(HTREEITEM item, int& image, int& selectedImage) const;
    bool SetItemData(HTREEITEM item, std::uint32_t data);
    std::uint32_t GetItemData(HTREEITEM item) const;

    HTREEITEM GetRootItem() const;
    HTREEITEM GetChildItem(HTREEITEM item) const;
    HTREEITEM GetNextSiblingItem(HTREEITEM item) const;
    HTREEITEM GetPrevSiblingItem(HTREEITEM item) const;
    HTREEITEM GetParentItem(HTREEITEM item) const;
    bool ItemHasChildren(HTREEITEM item) const;
    // Depth of an item, 0 at the root level.
    int GetItemLevel(HTREEITEM item) const;

    bool Expand(HTREEITEM item, unsigned code);
    bool IsExpanded(HTREEITEM item) const;
    // Sorts the children of the item (the root level for TVI_ROOT), and theirs, in
    // ascending order of text without regard to case; equal texts keep their order.
    bool SortChildren(HTREEITEM item);

    // Selection and scrolling. EnsureVisible expands the ancestors and scrolls the item
    // into the rows a view shows.
    bool SelectItem(HTREEITEM item);
    HTREEITEM GetSelectedItem() const { return selected_; }
    bool EnsureVisible(HTREEITEM item);

    // Geometry (see the class comment). A view sets its metrics and the number of rows it
    // shows (0: all); scrolling moves the first visible row.
    struct Metrics {
        int rowHeight = 1;
        int indent = 4;
        int imageWidth = 3;
        int origin = 0; // room before a root item's image (for its button)
    };
    void SetMetrics(const Metrics& metrics) { metrics_ = metrics; }
    const Metrics& GetMetrics() const { return metrics_; }
    void SetVisibleCount(int rows);
    int GetVisibleCount() const { return visibleRows_; }
    int GetScrollPos() const { return topRow_; }
    void SetScrollPos(int row);
    // The shown rows, from the first visible one (all of them with `all`).
    std::vector<HTREEITEM> GetVisibleItems(bool all = false) const;
    // The item at a client point, with TVHT_* flags; null (TVHT_NOWHERE) below the rows.
    HTREEITEM HitTest(CPoint point, unsigned* flags) const;
    // Where a part of a shown item lies, in client coordinates (the row: from the left
    // edge to the end of the text); false when not shown.
    bool GetItemRect(HTREEITEM item, CRect& rect, VelTreePart part) const;

private:
    friend class CVelDialog;
    friend void DDX_Control(CDataExchange*, int, SECTreeCtrl&);
    void VisibleRows(std::vector<HTREEITEM>& rows) const;
    int RowOf(HTREEITEM item) const;

    int id_ = 0;
    std::vector<Column> columns_;
    bool storeColumnText_ = false;
    int clientWidth_ = 0;
    int imageCount_ = 0;
    // Items live in blocks kept across DeleteAllItems: a rebuild reuses their memory.
    static constexpr std::size_t kBlock = 256;
    std::vector<std::unique_ptr<VelTreeItem[]>> blocks_;
    std::vector<VelTreeItem*> roots_;
    std::size_t count_ = 0;
    HTREEITEM selected_ = nullptr;
    Metrics metrics_;
    int visibleRows_ = 0;
    int topRow_ = 0;
};

// ---- data exchange ----

// Direction of one exchange: controls -> members when saving.
class CDataExchange {
public:
    CDataExchange(CVelDialog& dialog, bool saveAndValidate) : m_pDlgWnd(&dialog), m_bSaveAndValidate(saveAndValidate) {}
    CVelDialog* m_pDlgWnd;
    bool m_bSaveAndValidate;
    bool m_bFailed = false;
};

// Binds a tree member to the template's tree control of that id; a missing control
// fails the exchange.
void DDX_Control(CDataExchange* pDX, int id, SECTreeCtrl& tree);
// The index of the checked radio button in the group starting at `firstId` (-1 when
// none) to and from `value`.
void DDX_Radio(CDataExchange* pDX, int firstId, int& value);

// ---- resize rules ----

// Moves and stretches controls by percentages of the change of the dialog's size.
class CVelResizeInfoArray {
public:
    // Records the dialog's size and the controls' rectangles as the origin of later moves.
    void init(CVelDialog* dialog);
    void addCtrl(int id, int moveX, int moveY, int growX, int growY);
    // The rectangles of the registered controls for a new dialog size.
    void Apply(int width, int height);
    bool Empty() const { return rules_.empty(); }

private:
    struct Rule {
        int id;
        int moveX, moveY, growX, growY;
        CRect origin;
    };
    CVelDialog* dialog_ = nullptr;
    int width_ = 0;
    int height_ = 0;
    std::vector<Rule> rules_;
};

// ---- the dialog base ----

// Answers, through `key`, the registry key under which a profile's settings live.
using VelRootKeyCallback = void (*)(std::string& key, const std::string& profile);

// Registry key of a user profile's settings ("Software\Velanto\Profils\<profile>").
std::string velProfileRegistryKey(const std::string& profile);

// A modal dialog built from a template. A derived dialog overrides DoDataExchange,
// PreTranslateMessage, OnInitDialog, OnOK (and OnCancel) and maps its control
// notifications with OnNotifyMessage / OnCommandMessage in its constructor.
//
// What a view does, in order:
//  1. StartModal() (the dialog binds its controls and runs OnInitDialog); a dialog that
//     closed itself there is already IsEnded().
//  2. Shows GetTemplate(), GetTree(id) (items, states = image index, columns, expand
//     state, selection), IsDlgButtonChecked(id) for radio buttons, GetFocusId(),
//     GetControlRect(id) and TreeCaption(id); after a terminal resize, Resize(w, h) in
//     dialog units applies the resize rules.
//  3. Turns acts into calls, then shows the dialog again:
//     - a mouse press on a tree at a client point: Click(treeId, point). The dialog
//       sees WM_LBUTTONDOWN in PreTranslateMessage, the tree selects the item under the
//       point (or, on an item's button, opens or closes it), then NM_CLICK reaches the
//       mapped handler, which decides by hit test whether the point is on the check
//       image (toggle) or the text (nothing more);
//     - Space on a tree's selected item: Click at the centre of its image rectangle
//       (GetItemRect(item, r, VelTreePart::kImage)), exactly as the mouse would;
//     - arrows, pages, opening and closing: the tree's own SelectItem, Expand,
//       EnsureVisible, SetScrollPos (no message: the dialog is not told);
//     - a radio button or push button clicked: Click(id, {}); a radio button is
//       checked, the others of its group unchecked, then BN_CLICKED goes to the mapped
//       handler; IDOK runs OnOK, IDCANCEL OnCancel;
//     - a key: KeyDown(vk, shift). It goes through PreTranslateMessage first (which may
//       change it: the quantities dialog turns Enter into Tab); then Tab / Shift-Tab
//       move the focus among tab stops, Escape cancels, Enter or Space on a focused
//       button presses it, Space on a focused radio button clicks it, the arrows on a
//       focused radio button click the previous or next one of its group;
//     - the window's close box, end of input, ^C: Close() (WM_CLOSE, as "Quitter").
//  4. Stops when IsEnded(); GetResult() is IDOK or IDCANCEL.
class CVelDialog {
public:
    CVelDialog(VelDialogTemplate dialogTemplate, void* parent, void* resourceInstance);
    virtual ~CVelDialog();
    CVelDialog(const CVelDialog&) = delete;
    CVelDialog& operator=(const CVelDialog&) = delete;

    // Runs the dialog through the host's user interface; IDOK or IDCANCEL.
    int DoModal();

    // ---- for views ----
    bool StartModal();
    bool IsEnded() const { return ended_; }
    int GetResult() const { return result_; }
    const VelDialogTemplate& GetTemplate() const { return template_; }
    SECTreeCtrl* GetTree(int id) const;
    bool IsDlgButtonChecked(int id) const;
    int GetFocusId() const { return focus_; }
    bool SetFocusId(int id);
    // The control's rectangle after the resize rules (dialog units).
    CRect GetControlRect(int id) const;
    int GetWidth() const { return width_; }
    int GetHeight() const { return height_; }
    void Resize(int width, int height);
    // The title a view shows above a tree: the template's text unless overridden.
    virtual std::string TreeCaption(int treeId) const;
    void Click(int id, CPoint point);
    void KeyDown(unsigned virtualKey, bool shift = false);
    void Close();

    // ---- for the derived dialog ----
    virtual void DoDataExchange(CDataExchange* pDX);
    // True when the message was handled and goes no further.
    virtual bool PreTranslateMessage(MSG* pMsg);
    virtual bool OnInitDialog();
    virtual void OnOK();
    virtual void OnCancel();
    // Exchange between controls and members; false when it failed.
    virtual bool UpdateData(bool saveAndValidate = true);
    void EndDialog(int result);
    // Queues a message handled once the current call returns (WM_CLOSE only).
    void PostMessage(unsigned message);
    void CheckRadioButton(int firstId, int lastId, int checkedId);
    void EnableToolTips(bool enable) { toolTips_ = enable; }

    // Placement settings. A terminal dialog has no window placement to keep; what a
    // person wants found again is the choice made in each radio group. With persistence
    // on, a dialog ended by IDOK keeps that choice under the root key (ProfileKey), and
    // ReadPosition clicks the button kept there, as the person would (false when none is
    // kept). A scripted run neither reads nor writes it: a script says what it wants.
    void SetRootKey(VelRootKeyCallback callback, const std::string& profile);
    std::string ProfileKey() const;
    void SetDialogName(const std::string& name) { dialogName_ = name; }
    const std::string& GetDialogName() const { return dialogName_; }
    void SetPersistency(bool persist) { persist_ = persist; }
    bool GetPersistency() const { return persist_; }
    void SetResizeBitmap(bool show) { resizeBitmap_ = show; }
    bool GetResizeBitmap() const { return resizeBitmap_; }
    bool ReadPosition();

    void* GetParent() const { return parent_; }
    void* GetResourceInstance() const { return resourceInstance_; }

protected:
    using NotifyHandler = std::function<void(long* result)>;
    using CommandHandler = std::function<void()>;
    // The message map: a notification or command from a control to its handler.
    void OnNotifyMessage(int id, int code, NotifyHandler handler);
    void OnCommandMessage(int id, int code, CommandHandler handler);

    CVelResizeInfoArray m_resizeInfo;

private:
    friend void DDX_Control(CDataExchange*, int, SECTreeCtrl&);
    friend class CVelResizeInfoArray;
    void Notify(int id, int code);
    void Command(int id, int code);
    void WritePosition();
    void RunPosted();
    void MoveFocus(bool backwards);
    std::vector<int> FocusOrder() const;

    VelDialogTemplate template_;
    void* parent_;
    void* resourceInstance_;
    std::vector<CRect> rects_; // current rectangles, in template order
    int width_ = 0;
    int height_ = 0;
    std::vector<std::pair<int, SECTreeCtrl*>> trees_;
    std::vector<int> checkedRadios_;
    struct Handler {
        int id;
        int code;
        bool notify;
        NotifyHandler onNotify;
        CommandHandler onCommand;
    };
    std::vector<Handler> handlers_;
    std::vector<unsigned> posted_;
    int focus_ = 0;
    bool started_ = false;
    bool ended_ = false;
    int result_ = 0;
    bool toolTips_ = true;
    VelRootKeyCallback rootKey_ = nullptr;
    std::string profile_;
    std::string dialogName_;
    bool persist_ = false;
    bool resizeBitmap_ = false;
};

// ---- views ----

class VelUserInterface;

// The line view: runs a dialog from lines read through the user interface (a script's,
// or typed at the terminal's prompt). Each control with a script name is a verb:
// "<tree name> <path>" clicks the check box of the first item in tree order whose texts
// from the root, joined with one backslash, equal the path; a radio button's or push
// button's name clicks it; "afficher" prints every tree. The end of input or "^C" is
// Close(). In a script, a path that names no item or an unknown line stops the dialog
// (closed, as "Quitter") and fails the running command (velFailCommand); at the
// terminal it is said and the next line is read. Answers the dialog's result.
int velRunDialogLines(CVelDialog& dialog, VelUserInterface& ui);

// The screen view: the dialog drawn on the whole terminal (ncurses, wide characters, a
// UTF-8 character type while it shows), its controls placed by the template and the
// resize rules, keys and mouse turned into the calls above; afterwards the terminal is
// as it was. Where the terminal cannot show it (input or output not a terminal, TERM
// unset, unknown or unable to place the cursor, too small), it says so through `ui` and
// closes the dialog as "Quitter". Answers the dialog's result.
int velRunDialogScreen(CVelDialog& dialog, VelUserInterface& ui);

// The trees as the line view's "afficher" prints them: for each tree its caption on a
// line, then one item a line, four spaces of indent per level, "[ ]", "[x]" or "[~]",
// a space, the text and, for an item with column texts, " | " and each column.
std::string velDialogTreesText(const CVelDialog& dialog);

#pragma GCC visibility pop

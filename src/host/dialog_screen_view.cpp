// The screen view of dialogs: the template's controls drawn on the whole terminal with
// ncurses (wide characters), placed by the resize rules, and the keys and mouse turned
// into the same calls as the line view makes.
#define NCURSES_WIDECHAR 1
#define NCURSES_NOMACROS 1
#include <curses.h>
#include <sys/ioctl.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cmath>
#include <cstdio>
#include <cwchar>
#include <iostream>
#include <string>
#include <vector>

#include "host_internal.h"
#include "text/text.hpp"
#include "velhost/dialog.h"
#include "velhost/ui.h"

namespace {

// The terminal's "font": dialog units per cell. 428 units across fill 80 columns, and
// the option box of the quantities dialog (45 units) gets the four rows its two radio
// buttons need. The template's size in cells is the least that is drawn unchanged.
constexpr double kUnitsPerColumn = 5.35;
constexpr double kUnitsPerRow = 11.25;
// A tree shorter than this (borders included) shows too little to choose from.
constexpr int kMinTreeRows = 5;
constexpr int kMinTreeColumns = 12;
// The tree rows: an open/closed mark, the check box, a blank, the text.
constexpr SECTreeCtrl::Metrics kTreeMetrics{1, 2, 3, 1};
constexpr int kWheelRows = 3;
constexpr int kEscapeDelayMs = 100;

int ColumnOf(int units)
{
    return static_cast<int>(std::lround(units / kUnitsPerColumn));
}
int RowOf(int units)
{
    return static_cast<int>(std::lround(units / kUnitsPerRow));
}

// Cells of a control: columns [left, right), rows [top, bottom).
struct Cells {
    int left = 0;
    int top = 0;
    int right = 0;
    int bottom = 0;
    bool Contains(int x, int y) const { return x >= left && x < right && y >= top && y < bottom; }
    int Width() const { return right - left; }
    int Height() const { return bottom - top; }
};

struct Placed {
    const VelDialogControl* control;
    Cells cells;
};

// ---- text in cells ----

std::wstring Wide(const std::string& text)
{
    std::wstring wide;
    for (char32_t c : DecodeUtf8(text)) {
        // A control character would move the terminal's cursor away from ncurses' idea of it.
        const bool control = c < 0x20 || (c >= 0x7F && c < 0xA0);
        wide += control ? L'\uFFFD' : static_cast<wchar_t>(c);
    }
    return wide;
}

int CellsOf(wchar_t c)
{
    const int width = ::wcwidth(c);
    return width < 0 ? 1 : width;
}

int CellsOf(const std::wstring& text)
{
    int width = 0;
    for (wchar_t c : text)
        width += CellsOf(c);
    return width;
}

// The text in at most `width` cells, cut with "…" when longer.
std::wstring Fit(const std::wstring& text, int width)
{
    if (width <= 0)
        return {};
    if (CellsOf(text) <= width)
        return text;
    std::wstring cut;
    int used = 0;
    for (wchar_t c : text) {
        if (used + CellsOf(c) > width - 1)
            break;
        cut += c;
        used += CellsOf(c);
    }
    return cut + L'…';
}

std::vector<std::wstring> Words(const std::wstring& text)
{
    std::vector<std::wstring> words;
    std::wstring word;
    for (wchar_t c : text + L' ') {
        if (c != L' ') {
            word += c;
        } else if (!word.empty()) {
            words.push_back(word);
            word.clear();
        }
    }
    return words;
}

void Put(int y, int x, const std::wstring& text, attr_t attributes = A_NORMAL)
{
    if (text.empty())
        return;
    wattrset(stdscr, static_cast<int>(attributes));
    mvwaddnwstr(stdscr, y, x, text.c_str(), static_cast<int>(text.size()));
    wattrset(stdscr, A_NORMAL);
}

void Fill(int y, int left, int right, attr_t attributes)
{
    if (right > left)
        Put(y, left, std::wstring(static_cast<std::size_t>(right - left), L' '), attributes);
}

void Frame(const Cells& c, attr_t attributes)
{
    if (c.Width() < 2 || c.Height() < 2)
        return;
    wattrset(stdscr, static_cast<int>(attributes));
    mvwadd_wch(stdscr, c.top, c.left, WACS_ULCORNER);
    mvwhline_set(stdscr, c.top, c.left + 1, WACS_HLINE, c.Width() - 2);
    mvwadd_wch(stdscr, c.top, c.right - 1, WACS_URCORNER);
    mvwvline_set(stdscr, c.top + 1, c.left, WACS_VLINE, c.Height() - 2);
    mvwvline_set(stdscr, c.top + 1, c.right - 1, WACS_VLINE, c.Height() - 2);
    mvwadd_wch(stdscr, c.bottom - 1, c.left, WACS_LLCORNER);
    mvwhline_set(stdscr, c.bottom - 1, c.left + 1, WACS_HLINE, c.Width() - 2);
    mvwadd_wch(stdscr, c.bottom - 1, c.right - 1, WACS_LRCORNER);
    wattrset(stdscr, A_NORMAL);
}

const wchar_t* CheckBox(int image)
{
    switch (image) {
    case 0:
        return L"[ ]";
    case 1:
        return L"[x]";
    case 2:
        return L"[~]";
    default:
        return L"[?]";
    }
}

// ---- the view ----

class ScreenView;
ScreenView* g_active = nullptr;

class ScreenView {
public:
    explicit ScreenView(CVelDialog& dialog) : dialog_(dialog) {}
    ~ScreenView() { Shut(); }
    ScreenView(const ScreenView&) = delete;
    ScreenView& operator=(const ScreenView&) = delete;

    // Starts the screen; "" when it is up, else why it cannot be.
    std::string Open();
    void Run();
    void Shut();
    // Leaves the screen for the command line until the next drawing.
    void Suspend();
    bool Showing() const { return screen_ != nullptr && !suspended_; }

private:
    bool Place(int columns, int lines, std::vector<Placed>& placed);
    void Layout();
    std::string TooSmall(int columns, int lines);
    void Draw();
    void DrawTitle();
    void DrawTree(const Placed& p);
    void DrawGroupBox(const Placed& p);
    void DrawRadio(const Placed& p);
    void DrawButton(const Placed& p);
    void DrawHelp();
    void Key(wint_t key, bool function);
    bool TreeKey(int id, wint_t key, bool function);
    void Mouse();
    const Placed* At(int x, int y) const;
    int FocusKind() const;

    CVelDialog& dialog_;
    SCREEN* screen_ = nullptr;
    int cursorVisibility_ = -1;
    bool suspended_ = false;
    std::vector<Placed> placed_;
    std::string tooSmall_;
    int cursorX_ = 0;
    int cursorY_ = 0;
};

std::string ScreenView::TooSmall(int columns, int lines)
{
    const VelDialogTemplate& t = dialog_.GetTemplate();
    const int leastColumns = ColumnOf(t.width);
    int leastLines = 0;
    std::vector<Placed> trial;
    for (int n = 3; n <= RowOf(t.height) + 1 && leastLines == 0; ++n)
        if (Place(leastColumns, n, trial))
            leastLines = n;
    if (leastLines == 0)
        leastLines = RowOf(t.height) + 1;
    return FormatString("le terminal fait %d colonnes sur %d lignes, il en faut au moins %d sur %d", columns, lines,
                        leastColumns, leastLines);
}

// Where each control goes on a terminal of that size: the dialog takes the size in
// units (whole cells more or less than its template, so that controls moved together
// keep their rows), the resize rules place the controls, and their edges are rounded to
// cells. Row 0 is the caption (in the template's top margin), the last row the key help.
// False when something does not fit.
bool ScreenView::Place(int columns, int lines, std::vector<Placed>& placed)
{
    placed.clear();
    const VelDialogTemplate& t = dialog_.GetTemplate();
    const int baseColumns = ColumnOf(t.width);
    const int clientRows = lines - 1;
    dialog_.Resize(t.width + static_cast<int>(std::lround((columns - baseColumns) * kUnitsPerColumn)),
                   t.height + static_cast<int>(std::lround((clientRows - RowOf(t.height)) * kUnitsPerRow)));
    for (const VelDialogControl& control : t.controls) {
        const CRect r = dialog_.GetControlRect(control.id);
        Cells c{ColumnOf(r.x), RowOf(r.y), ColumnOf(r.x + r.width), RowOf(r.y + r.height)};
        if (control.kind == VelControlKind::kRadio || control.kind == VelControlKind::kButton)
            c.bottom = c.top + 1;
        placed.push_back({&control, c});
    }
    // A terminal's characters are wider than the template's font: a group box and the
    // radio buttons in it take the room their texts need, up to the next control on
    // their right.
    for (Placed& box : placed) {
        if (box.control->kind != VelControlKind::kGroupBox)
            continue;
        std::vector<Placed*> members;
        int need = box.cells.left + CellsOf(Wide(box.control->text)) + 4;
        int limit = columns - 1;
        for (Placed& other : placed) {
            if (&other == &box)
                continue;
            const Cells& o = other.cells;
            const bool inside = o.top > box.cells.top && o.bottom < box.cells.bottom && o.left > box.cells.left &&
                                o.left < box.cells.right - 1;
            if (inside && other.control->kind == VelControlKind::kRadio) {
                members.push_back(&other);
                need = std::max(need, o.left + 4 + CellsOf(Wide(other.control->text)) + 2);
            } else if (o.top < box.cells.bottom && o.bottom > box.cells.top && o.left >= box.cells.right - 1) {
                limit = std::min(limit, o.left - 2);
            }
        }
        box.cells.right = std::max(box.cells.right, std::min(need, limit));
        for (Placed* member : members)
            member->cells.right = std::max(member->cells.right, box.cells.right - 1);
    }
    if (columns < baseColumns)
        return false;
    for (const Placed& p : placed) {
        const Cells& c = p.cells;
        if (c.left < 0 || c.top < 1 || c.right > columns || c.bottom > clientRows || c.Width() < 1 || c.Height() < 1)
            return false;
        if (p.control->kind == VelControlKind::kTree && (c.Height() < kMinTreeRows || c.Width() < kMinTreeColumns))
            return false;
    }
    return true;
}

std::string ScreenView::Open()
{
    const std::string problem = velScreenTerminalProblem();
    if (!problem.empty())
        return problem;
    // Said before the screen changes, when the size is known.
    winsize size{};
    if (ioctl(STDOUT_FILENO, TIOCGWINSZ, &size) == 0 && size.ws_col > 0 && size.ws_row > 0) {
        std::vector<Placed> trial;
        if (!Place(size.ws_col, size.ws_row, trial))
            return TooSmall(size.ws_col, size.ws_row);
    }
    std::cout.flush();
    std::fflush(stdout);
    screen_ = newterm(nullptr, stdout, stdin);
    if (screen_ == nullptr)
        return "le terminal ne peut pas être initialisé";
    std::vector<Placed> trial;
    if (!Place(COLS, LINES, trial)) {
        const int columns = COLS, lines = LINES;
        Shut();
        return TooSmall(columns, lines);
    }
    // Every key reaches the dialog: ^C is "Quitter", not a signal.
    raw();
    noecho();
    nonl();
    keypad(stdscr, TRUE);
    set_escdelay(kEscapeDelayMs);
    cursorVisibility_ = curs_set(0);
    mousemask(BUTTON1_PRESSED | BUTTON4_PRESSED | BUTTON5_PRESSED, nullptr);
    mouseinterval(0);
    g_active = this;
    return {};
}

void ScreenView::Shut()
{
    if (screen_ == nullptr)
        return;
    if (g_active == this)
        g_active = nullptr;
    if (!suspended_) {
        mousemask(0, nullptr);
        if (cursorVisibility_ != -1)
            curs_set(cursorVisibility_);
        endwin();
    }
    delscreen(screen_);
    screen_ = nullptr;
    std::fflush(stdout);
}

void ScreenView::Suspend()
{
    if (!Showing())
        return;
    mousemask(0, nullptr);
    endwin();
    suspended_ = true;
}

void ScreenView::Layout()
{
    tooSmall_.clear();
    if (!Place(COLS, LINES, placed_)) {
        tooSmall_ = TooSmall(COLS, LINES);
        return;
    }
    for (const Placed& p : placed_) {
        if (p.control->kind != VelControlKind::kTree)
            continue;
        if (SECTreeCtrl* tree = dialog_.GetTree(p.control->id)) {
            tree->SetMetrics(kTreeMetrics);
            tree->SetVisibleCount(p.cells.Height() - 2);
            if (HTREEITEM selected = tree->GetSelectedItem())
                tree->EnsureVisible(selected);
        }
    }
}

void ScreenView::Run()
{
    Layout();
    while (!dialog_.IsEnded()) {
        if (suspended_) {
            // Back from the command line: everything is drawn again.
            suspended_ = false;
            mousemask(BUTTON1_PRESSED | BUTTON4_PRESSED | BUTTON5_PRESSED, nullptr);
            clearok(curscr, TRUE);
            Layout();
        }
        // The focused tree always shows where Space would act.
        if (SECTreeCtrl* tree = dialog_.GetTree(dialog_.GetFocusId())) {
            const std::vector<HTREEITEM> shown = tree->GetVisibleItems();
            if (tree->GetSelectedItem() == nullptr && !shown.empty())
                tree->SelectItem(shown.front());
        }
        Draw();
        wint_t key = 0;
        const int got = wget_wch(stdscr, &key);
        if (got == ERR) {
            if (errno == EINTR)
                continue;
            // The terminal has gone: as its close box.
            dialog_.Close();
            break;
        }
        Key(key, got == KEY_CODE_YES);
    }
}

// ---- drawing ----

int ScreenView::FocusKind() const
{
    const VelDialogControl* focused = dialog_.GetTemplate().Find(dialog_.GetFocusId());
    return focused ? static_cast<int>(focused->kind) : -1;
}

void ScreenView::Draw()
{
    werase(stdscr);
    cursorX_ = cursorY_ = 0;
    DrawTitle();
    if (!tooSmall_.empty()) {
        // Said in words that fit, however narrow the terminal.
        std::vector<std::wstring> lines{L""};
        for (const std::wstring& word : Words(Wide("Agrandissez le terminal : " + tooSmall_ + "."))) {
            if (!lines.back().empty() && CellsOf(lines.back()) + 1 + CellsOf(word) > COLS - 2)
                lines.emplace_back();
            lines.back() += (lines.back().empty() ? L"" : L" ") + word;
        }
        lines.push_back(L"Échap : Quitter");
        int y = std::max(1, (LINES - static_cast<int>(lines.size())) / 2);
        for (const std::wstring& line : lines) {
            const std::wstring shown = Fit(line, COLS);
            Put(y++, std::max(0, (COLS - CellsOf(shown)) / 2), shown, &line == &lines.back() ? A_NORMAL : A_BOLD);
        }
    } else {
        for (const Placed& p : placed_) {
            switch (p.control->kind) {
            case VelControlKind::kTree:
                DrawTree(p);
                break;
            case VelControlKind::kGroupBox:
                DrawGroupBox(p);
                break;
            case VelControlKind::kRadio:
                DrawRadio(p);
                break;
            case VelControlKind::kButton:
                DrawButton(p);
                break;
            }
        }
        DrawHelp();
    }
    wmove(stdscr, cursorY_, cursorX_);
    wrefresh(stdscr);
}

void ScreenView::DrawTitle()
{
    Fill(0, 0, COLS, A_REVERSE);
    const std::wstring caption = Fit(Wide(dialog_.GetTemplate().caption), std::max(0, COLS - 8));
    Put(0, std::max(0, (COLS - CellsOf(caption)) / 2), caption, A_REVERSE | A_BOLD);
    if (COLS >= 4)
        Put(0, COLS - 4, L"[×]", A_REVERSE);
}

void ScreenView::DrawTree(const Placed& p)
{
    const Cells& c = p.cells;
    SECTreeCtrl* tree = dialog_.GetTree(p.control->id);
    const bool focused = dialog_.GetFocusId() == p.control->id;
    Frame(c, focused ? A_BOLD : A_NORMAL);
    if (tree == nullptr)
        return;
    const int inLeft = c.left + 1, inRight = c.right - 1, top = c.top + 1;

    // Column bounds in cells, in the proportions of the columns' widths.
    const std::vector<SECTreeCtrl::Column>& columns = tree->GetColumns();
    long total = 0;
    for (const SECTreeCtrl::Column& column : columns)
        total += std::max(0, column.width);
    std::vector<int> bounds{inLeft};
    long sum = 0;
    for (std::size_t i = 0; i < columns.size(); ++i) {
        sum += std::max(0, columns[i].width);
        const bool last = i + 1 == columns.size() || total <= 0;
        const double share = total > 0 ? static_cast<double>(sum) / static_cast<double>(total) : 1.0;
        bounds.push_back(last ? inRight : inLeft + static_cast<int>(std::lround((inRight - inLeft) * share)));
        if (last)
            break;
    }
    // Headings on the top border, each over its column.
    for (std::size_t i = 0; i + 1 < bounds.size(); ++i) {
        const int width = bounds[i + 1] - bounds[i];
        const std::wstring heading = Fit(Wide(columns[i].heading), width - 2);
        if (heading.empty())
            continue;
        const std::wstring label = L" " + heading + L" ";
        const int x = columns[i].format == 1 ? bounds[i + 1] - CellsOf(label) : bounds[i];
        Put(c.top, x, label, focused ? A_BOLD : A_NORMAL);
    }

    const std::vector<HTREEITEM> rows = tree->GetVisibleItems();
    const HTREEITEM selected = tree->GetSelectedItem();
    bool cut = false;
    for (std::size_t r = 0; r < rows.size() && top + static_cast<int>(r) < c.bottom - 1; ++r) {
        const HTREEITEM item = rows[r];
        const int y = top + static_cast<int>(r);
        const bool isSelected = item == selected;
        const attr_t attributes = isSelected ? (focused ? A_REVERSE : A_UNDERLINE) : A_NORMAL;
        if (isSelected)
            Fill(y, inLeft, inRight, attributes);
        const int x = inLeft + kTreeMetrics.origin + tree->GetItemLevel(item) * kTreeMetrics.indent;
        if (tree->ItemHasChildren(item) && x - 1 < bounds[1])
            Put(y, x - 1, tree->IsExpanded(item) ? L"▾" : L"▸", attributes);
        int image = 0, selectedImage = 0;
        tree->GetItemImage(item, image, selectedImage);
        if (x + kTreeMetrics.imageWidth <= bounds[1])
            Put(y, x, CheckBox(image), attributes);
        const int textX = x + kTreeMetrics.imageWidth + 1;
        const std::wstring text = Wide(tree->GetItemText(item));
        const std::wstring shown = Fit(text, bounds[1] - 1 - textX);
        Put(y, textX, shown, attributes);
        if (isSelected && focused) {
            cut = shown != text;
            cursorX_ = x + 1;
            cursorY_ = y;
        }
        for (std::size_t i = 1; i + 1 < bounds.size(); ++i) {
            const std::wstring value =
                Fit(Wide(tree->GetItemText(item, static_cast<int>(i))), bounds[i + 1] - bounds[i] - 2);
            const int valueX = columns[i].format == 1 ? bounds[i + 1] - 1 - CellsOf(value) : bounds[i] + 1;
            Put(y, valueX, value, attributes);
        }
    }
    // Where the rows go on beyond the box.
    const std::vector<HTREEITEM> all = tree->GetVisibleItems(true);
    if (!rows.empty() && rows.front() != all.front())
        Put(top, c.right - 1, L"▲", A_BOLD);
    if (!rows.empty() && rows.back() != all.back())
        Put(c.bottom - 2, c.right - 1, L"▼", A_BOLD);
    // The whole text of a selected item that the column cuts, on the bottom border.
    if (focused && cut)
        Put(c.bottom - 1, inLeft, L" " + Fit(Wide(tree->GetItemText(selected)), c.Width() - 4) + L" ");
    if (focused && cursorY_ == 0) {
        cursorX_ = inLeft;
        cursorY_ = top;
    }
}

void ScreenView::DrawGroupBox(const Placed& p)
{
    Frame(p.cells, A_NORMAL);
    const std::wstring caption = Fit(Wide(p.control->text), p.cells.Width() - 4);
    if (!caption.empty())
        Put(p.cells.top, p.cells.left + 1, L" " + caption + L" ");
}

void ScreenView::DrawRadio(const Placed& p)
{
    const bool focused = dialog_.GetFocusId() == p.control->id;
    const attr_t attributes = focused ? A_REVERSE : A_NORMAL;
    Put(p.cells.top, p.cells.left, dialog_.IsDlgButtonChecked(p.control->id) ? L"(•)" : L"( )");
    Put(p.cells.top, p.cells.left + 4, Fit(Wide(p.control->text), p.cells.Width() - 5), attributes);
    if (focused) {
        cursorX_ = p.cells.left + 1;
        cursorY_ = p.cells.top;
    }
}

void ScreenView::DrawButton(const Placed& p)
{
    const bool focused = dialog_.GetFocusId() == p.control->id;
    const std::wstring label = L"[ " + Fit(Wide(p.control->text), p.cells.Width() - 4) + L" ]";
    const int x = p.cells.left + std::max(0, (p.cells.Width() - CellsOf(label)) / 2);
    Put(p.cells.top, x, label, focused ? A_REVERSE | A_BOLD : A_BOLD);
    if (focused) {
        cursorX_ = x + 2;
        cursorY_ = p.cells.top;
    }
}

void ScreenView::DrawHelp()
{
    struct Help {
        const wchar_t* key;
        const wchar_t* does;
    };
    std::vector<Help> help;
    switch (FocusKind()) {
    case static_cast<int>(VelControlKind::kTree):
        help = {{L"Espace", L"cocher"},
                {L"→ ←", L"ouvrir, fermer"},
                {L"↑ ↓", L"aller"},
                {L"Tab", L"suivant"},
                {L"Échap", L"quitter"}};
        break;
    case static_cast<int>(VelControlKind::kRadio):
        help = {{L"↑ ↓", L"choisir"}, {L"Tab", L"suivant"}, {L"Échap", L"quitter"}};
        break;
    default:
        help = {{L"Espace", L"appuyer"}, {L"Tab", L"suivant"}, {L"Échap", L"quitter"}};
        break;
    }
    const int y = LINES - 1;
    int x = 1;
    for (const Help& h : help) {
        const std::wstring key = h.key, does = std::wstring(L" ") + h.does;
        if (x + CellsOf(key) + CellsOf(does) > COLS - 1)
            break;
        Put(y, x, key, A_BOLD);
        Put(y, x + CellsOf(key), does);
        x += CellsOf(key) + CellsOf(does) + 2;
    }
}

// ---- acts ----

const Placed* ScreenView::At(int x, int y) const
{
    // Radio buttons and push buttons first: a radio button lies inside its group box.
    for (const Placed& p : placed_)
        if (p.control->kind != VelControlKind::kGroupBox && p.cells.Contains(x, y))
            return &p;
    return nullptr;
}

void ScreenView::Key(wint_t key, bool function)
{
    if (function && key == KEY_RESIZE) {
        Layout();
        return;
    }
    if (function && key == KEY_MOUSE) {
        if (tooSmall_.empty())
            Mouse();
        return;
    }
    if (!function) {
        switch (key) {
        case 3: // ^C
            dialog_.Close();
            return;
        case 27:
            dialog_.KeyDown(VK_ESCAPE);
            return;
        default:
            break;
        }
    }
    if (!tooSmall_.empty())
        return;
    const int focus = dialog_.GetFocusId();
    if (FocusKind() == static_cast<int>(VelControlKind::kTree) && TreeKey(focus, key, function))
        return;
    if (!function) {
        switch (key) {
        case L'\t':
            dialog_.KeyDown(VK_TAB);
            return;
        case L'\r':
        case L'\n':
            dialog_.KeyDown(VK_RETURN);
            return;
        case L' ':
            dialog_.KeyDown(VK_SPACE);
            return;
        default:
            return;
        }
    }
    switch (key) {
    case KEY_BTAB:
        dialog_.KeyDown(VK_TAB, true);
        break;
    case KEY_ENTER:
        dialog_.KeyDown(VK_RETURN);
        break;
    case KEY_UP:
        dialog_.KeyDown(VK_UP);
        break;
    case KEY_DOWN:
        dialog_.KeyDown(VK_DOWN);
        break;
    case KEY_LEFT:
        dialog_.KeyDown(VK_LEFT);
        break;
    case KEY_RIGHT:
        dialog_.KeyDown(VK_RIGHT);
        break;
    default:
        break;
    }
}

// Moving, opening and closing are the tree's own; Space is a click on the check box.
bool ScreenView::TreeKey(int id, wint_t key, bool function)
{
    SECTreeCtrl* tree = dialog_.GetTree(id);
    if (tree == nullptr)
        return false;
    const std::vector<HTREEITEM> rows = tree->GetVisibleItems(true);
    if (rows.empty())
        return false;
    const HTREEITEM selected = tree->GetSelectedItem();
    const auto at = std::find(rows.begin(), rows.end(), selected);
    const int last = static_cast<int>(rows.size()) - 1;
    const int index = at == rows.end() ? -1 : static_cast<int>(at - rows.begin());
    const int page = std::max(1, tree->GetVisibleCount() - 1);
    const auto go = [&](int to) {
        HTREEITEM item = rows[static_cast<std::size_t>(std::clamp(to, 0, last))];
        tree->SelectItem(item);
        tree->EnsureVisible(item);
        return true;
    };
    if (index < 0)
        return false;
    if (!function) {
        switch (key) {
        case L' ': {
            tree->EnsureVisible(selected);
            CRect box;
            if (tree->GetItemRect(selected, box, VelTreePart::kImage))
                dialog_.Click(id, {box.x + box.width / 2, box.y + box.height / 2});
            return true;
        }
        case L'+':
            tree->Expand(selected, TVE_EXPAND);
            return true;
        case L'-':
            tree->Expand(selected, TVE_COLLAPSE);
            return true;
        default:
            return false;
        }
    }
    switch (key) {
    case KEY_UP:
        return go(index - 1);
    case KEY_DOWN:
        return go(index + 1);
    case KEY_PPAGE:
        return go(index - page);
    case KEY_NPAGE:
        return go(index + page);
    case KEY_HOME:
        return go(0);
    case KEY_END:
        return go(last);
    case KEY_RIGHT:
        if (!tree->ItemHasChildren(selected))
            return true;
        if (!tree->IsExpanded(selected)) {
            tree->Expand(selected, TVE_EXPAND);
            return true;
        }
        return go(index + 1);
    case KEY_LEFT:
        if (tree->ItemHasChildren(selected) && tree->IsExpanded(selected)) {
            tree->Expand(selected, TVE_COLLAPSE);
            return true;
        }
        if (HTREEITEM parent = tree->GetParentItem(selected)) {
            tree->SelectItem(parent);
            tree->EnsureVisible(parent);
        }
        return true;
    default:
        return false;
    }
}

void ScreenView::Mouse()
{
    MEVENT event{};
    if (getmouse(&event) != OK)
        return;
    if (event.y == 0) {
        if (event.x >= COLS - 4 && event.x < COLS - 1 && (event.bstate & BUTTON1_PRESSED))
            dialog_.Close();
        return;
    }
    const Placed* p = At(event.x, event.y);
    if (p == nullptr)
        return;
    const int id = p->control->id;
    if (p->control->kind != VelControlKind::kTree) {
        if (event.bstate & BUTTON1_PRESSED)
            dialog_.Click(id, {});
        return;
    }
    SECTreeCtrl* tree = dialog_.GetTree(id);
    if (tree == nullptr)
        return;
    const Cells& c = p->cells;
    if (event.bstate & (BUTTON4_PRESSED | BUTTON5_PRESSED)) {
        // The wheel scrolls; the selection stays where it is.
        const std::vector<HTREEITEM> all = tree->GetVisibleItems(true);
        const std::vector<HTREEITEM> shown = tree->GetVisibleItems();
        if (shown.empty())
            return;
        const int top = static_cast<int>(std::find(all.begin(), all.end(), shown.front()) - all.begin());
        tree->SetScrollPos(top + ((event.bstate & BUTTON4_PRESSED) ? -kWheelRows : kWheelRows));
        return;
    }
    if (!(event.bstate & BUTTON1_PRESSED))
        return;
    const bool inside = event.x > c.left && event.x < c.right - 1 && event.y > c.top && event.y < c.bottom - 1;
    if (inside)
        dialog_.Click(id, {event.x - (c.left + 1), event.y - (c.top + 1)});
    else
        dialog_.SetFocusId(id);
}

} // namespace

bool velDialogScreenShowing()
{
    return g_active != nullptr && g_active->Showing();
}

void velSuspendDialogScreen()
{
    if (g_active != nullptr)
        g_active->Suspend();
}

int velRunDialogScreen(CVelDialog& dialog, VelUserInterface& ui)
{
    if (!dialog.StartModal())
        return dialog.GetResult();
    std::string why;
    {
        // ncurses draws and reads wide characters only under a UTF-8 character type.
        VelUtf8CharacterType utf8;
        ScreenView view(dialog);
        why = view.Open();
        if (why.empty())
            view.Run();
    }
    if (!why.empty()) {
        ui.print(FormatString("%s : impossible d'afficher le dialogue, %s ; il se ferme comme par « Quitter ».\n",
                              dialog.GetTemplate().caption.c_str(), why.c_str()));
        dialog.Close();
    }
    return dialog.GetResult();
}

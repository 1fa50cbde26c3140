// The line view of dialogs: each line read (from a script, or typed at the terminal's
// prompt) names a control and acts on it as the mouse would; "afficher" prints the trees.
#include <string>

#include "text/text.hpp"
#include "velhost/commands.h"
#include "velhost/dialog.h"
#include "velhost/ui.h"

namespace {

constexpr const char* kShowVerb = "afficher";

const char* StateText(int image)
{
    switch (image) {
    case 0:
        return "[ ]";
    case 1:
        return "[x]";
    case 2:
        return "[~]";
    default:
        return "[?]";
    }
}

void PrintItems(const SECTreeCtrl& tree, HTREEITEM item, int level, std::string& out)
{
    for (; item != nullptr; item = tree.GetNextSiblingItem(item)) {
        int image = 0, selected = 0;
        tree.GetItemImage(item, image, selected);
        out.append(static_cast<std::size_t>(level) * 4, ' ');
        out += StateText(image);
        out += ' ';
        out += tree.GetItemText(item);
        const std::size_t columns = tree.GetColumns().size();
        bool any = false;
        for (std::size_t c = 1; c < columns; ++c)
            any = any || !tree.GetItemText(item, static_cast<int>(c)).empty();
        if (any)
            for (std::size_t c = 1; c < columns; ++c)
                out += " | " + tree.GetItemText(item, static_cast<int>(c));
        out += '\n';
        PrintItems(tree, tree.GetChildItem(item), level + 1, out);
    }
}

// The first item in tree order whose texts from the root, joined with "\", are `path`.
HTREEITEM FindByPath(const SECTreeCtrl& tree, HTREEITEM first, const std::string& prefix, const std::string& path)
{
    for (HTREEITEM item = first; item != nullptr; item = tree.GetNextSiblingItem(item)) {
        const std::string here = prefix.empty() ? tree.GetItemText(item) : prefix + "\\" + tree.GetItemText(item);
        if (here == path)
            return item;
        // Only a prefix of the path can lead to it.
        if (path.size() > here.size() && path.compare(0, here.size(), here) == 0 && path[here.size()] == '\\')
            if (HTREEITEM found = FindByPath(tree, tree.GetChildItem(item), here, path))
                return found;
    }
    return nullptr;
}

// "projet <chemin>, article <chemin>, mode somme, ..., afficher".
std::string VerbList(const CVelDialog& dialog)
{
    std::vector<std::string> verbs;
    for (const VelDialogControl& control : dialog.GetTemplate().controls) {
        if (control.scriptName.empty())
            continue;
        verbs.push_back(control.kind == VelControlKind::kTree ? control.scriptName + " <chemin>" : control.scriptName);
    }
    verbs.push_back(kShowVerb);
    return JoinStrings(verbs, ", ");
}

// What a line asks: the control it names and, for a tree, the path.
struct LineAct {
    const VelDialogControl* control = nullptr;
    std::string path;
};

LineAct Parse(const CVelDialog& dialog, const std::string& text)
{
    for (const VelDialogControl& control : dialog.GetTemplate().controls) {
        if (control.scriptName.empty())
            continue;
        if (control.kind == VelControlKind::kTree) {
            const std::size_t n = control.scriptName.size();
            if (text.size() > n && (text[n] == ' ' || text[n] == '\t') &&
                EqualsNoCase(text.substr(0, n), control.scriptName))
                return {&control, TrimBlanks(text.substr(n))};
        } else if (EqualsNoCase(text, control.scriptName)) {
            return {&control, {}};
        }
    }
    return {};
}

} // namespace

std::string velDialogTreesText(const CVelDialog& dialog)
{
    std::string out;
    for (const VelDialogControl& control : dialog.GetTemplate().controls) {
        const SECTreeCtrl* tree = control.kind == VelControlKind::kTree ? dialog.GetTree(control.id) : nullptr;
        if (tree == nullptr)
            continue;
        out += dialog.TreeCaption(control.id) + "\n";
        PrintItems(*tree, tree->GetRootItem(), 0, out);
    }
    return out;
}

int velRunDialogLines(CVelDialog& dialog, VelUserInterface& ui)
{
    if (!dialog.StartModal())
        return dialog.GetResult();
    const std::string caption = dialog.GetTemplate().caption;
    const bool scripted = ui.isScripted();
    if (!scripted)
        ui.print(FormatString("%s : une ligne par action (%s).\n", caption.c_str(), VerbList(dialog).c_str()));
    // A line view shows whole trees: nothing scrolls.
    for (const VelDialogControl& control : dialog.GetTemplate().controls)
        if (SECTreeCtrl* tree = control.kind == VelControlKind::kTree ? dialog.GetTree(control.id) : nullptr)
            tree->SetVisibleCount(0);

    while (!dialog.IsEnded()) {
        const std::optional<VelInputLine> line = ui.readLine(caption + " : ");
        if (!line) {
            dialog.Close();
            break;
        }
        const std::string text = TrimBlanks(line->text);
        if (text.empty())
            continue;
        if (EqualsNoCase(text, kShowVerb)) {
            ui.print(velDialogTreesText(dialog));
            continue;
        }
        const LineAct act = Parse(dialog, text);
        std::string problem;
        if (act.control == nullptr) {
            problem = FormatString("« %s » n'est pas une action de ce dialogue (attendu : %s)", text.c_str(),
                                   VerbList(dialog).c_str());
        } else if (act.control->kind == VelControlKind::kTree) {
            SECTreeCtrl* tree = dialog.GetTree(act.control->id);
            HTREEITEM item = tree ? FindByPath(*tree, tree->GetRootItem(), {}, act.path) : nullptr;
            CRect box;
            if (item != nullptr && tree->EnsureVisible(item) && tree->GetItemRect(item, box, VelTreePart::kImage))
                dialog.Click(act.control->id, {box.x + box.width / 2, box.y + box.height / 2});
            else
                problem = FormatString("aucun élément « %s » dans l'arbre « %s »", act.path.c_str(),
                                       dialog.TreeCaption(act.control->id).c_str());
        } else {
            dialog.Click(act.control->id, {});
        }
        if (problem.empty())
            continue;
        if (!scripted) {
            ui.print(problem + ".\n");
            continue;
        }
        // A script that misnames something must not go on to write an estimate it did not mean.
        dialog.Close();
        velFailCommand(FormatString("%s, ligne %d du script : %s ; le dialogue est fermé comme par « Quitter ».",
                                    caption.c_str(), line->lineNumber, problem.c_str()));
    }
    return dialog.GetResult();
}

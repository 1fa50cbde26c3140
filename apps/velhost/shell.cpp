// velhost's command interpreter: OPEN, NEW, SAVE, SAVEAS, CLOSE, QUIT, APPLOAD, ARX,
// SETVAR, GETVAR and DOCUMENT, then the commands of the loaded modules.
#include "shell.h"

#include <filesystem>
#include <memory>
#include <vector>

#include "text/text.hpp"
#include "velhost/commands.h"
#include "velhost/dbase.h"
#include "velhost/documents.h"
#include "velhost/editor.h"
#include "velhost/rx.h"
#include "velhost/ui.h"

namespace fs = std::filesystem;

namespace {

// First word and the rest of a line.
std::pair<std::string, std::string> SplitFirst(const std::string& line)
{
    const std::string t = TrimBlanks(line);
    const auto space = t.find_first_of(" \t");
    if (space == std::string::npos)
        return {t, {}};
    return {t.substr(0, space), TrimBlanks(t.substr(space))};
}

std::vector<std::string> Words(const std::string& text)
{
    std::vector<std::string> words;
    std::string rest = TrimBlanks(text);
    while (!rest.empty()) {
        auto [first, tail] = SplitFirst(rest);
        words.push_back(first);
        rest = tail;
    }
    return words;
}

// The argument given on the command line, else asked for; false when cancelled.
bool Argument(std::string& given, const char* prompt, std::string& out)
{
    if (!given.empty()) {
        out = given;
        given.clear();
        return true;
    }
    return acedGetString(true, prompt, out) == RTNORM;
}

bool IsCommand(const std::string& word, std::initializer_list<const char*> names)
{
    std::string_view w(word);
    if (!w.empty() && w.front() == '_')
        w.remove_prefix(1);
    for (const char* n : names)
        if (EqualsNoCase(w, n))
            return true;
    return false;
}

AcApDocument* Current()
{
    return acDocManagerPtr()->curDocument();
}

bool SaveAs(AcApDocument* doc, const std::string& path, std::string& error)
{
    if (!velSaveDrawing(*doc->database(), path, error))
        return false;
    doc->setFileName(fs::absolute(path).lexically_normal().string());
    doc->setDocTitle(fs::path(path).filename().string());
    acutPrintf("Dessin enregistré dans %s.\n", doc->fileName().c_str());
    return true;
}

// Asks whether to save a modified drawing before it closes; false when the user
// cancels (the drawing then stays open).
bool SaveBeforeClosing(AcApDocument* doc, std::string& error)
{
    if (!doc->database()->isModified())
        return true;
    acedInitGet(0, "Oui Non Annuler _ Yes No Cancel");
    std::string answer;
    const int status = acedGetKword(
        FormatString("\nEnregistrer les modifications de %s ? [Oui/Non/Annuler] <Oui> : ", doc->docTitle().c_str())
            .c_str(),
        answer);
    if (status == RTCAN || (status == RTNORM && answer == "Cancel")) {
        error = FormatString("Fermeture de %s annulée.", doc->docTitle().c_str());
        return false;
    }
    if (status == RTNORM && answer == "No")
        return true;
    std::string path = doc->fileName();
    if (path.empty()) {
        std::string none;
        if (!Argument(none, "Nom du fichier DXF : ", path) || path.empty()) {
            error = FormatString("Fermeture de %s annulée.", doc->docTitle().c_str());
            return false;
        }
    }
    return SaveAs(doc, path, error);
}

bool CloseDocument(AcApDocument* doc, bool ask, std::string& error)
{
    if (ask && !SaveBeforeClosing(doc, error))
        return false;
    acDocManagerPtr()->closeDocument(doc);
    return true;
}

std::vector<AcApDocument*> OpenDocuments()
{
    std::vector<AcApDocument*> docs;
    std::unique_ptr<AcApDocumentIterator> it(acDocManagerPtr()->newAcApDocumentIterator());
    for (; !it->done(); it->step())
        docs.push_back(it->document());
    return docs;
}

bool ArxCommand(std::string rest, std::string& error)
{
    velUI().pushPendingInput(Words(rest));
    acedInitGet(0, "? Charger Décharger _ ? Load Unload");
    std::string option;
    const int status = acedGetKword("\nEntrez une option [?/Charger/Décharger] : ", option);
    if (status != RTNORM) {
        velUI().dropPendingInput();
        return true;
    }
    if (option == "?") {
        const auto modules = velLoadedModules();
        if (modules.empty())
            acutPrintf("Aucun module chargé.\n");
        for (const VelModuleInfo& m : modules)
            acutPrintf("%s%s%s\n", m.path.c_str(), m.locked ? " (verrouillé)" : "",
                       m.mdiAware ? "" : " (un seul dessin)");
        return true;
    }
    std::string name;
    if (acedGetString(true, option == "Load" ? "Module à charger : " : "Module à décharger : ", name) != RTNORM ||
        name.empty())
        return true;
    name = velModuleFileName(name);
    const bool ok = option == "Load" ? acrxDynamicLinker()->loadModule(name.c_str(), true, true)
                                     : acrxDynamicLinker()->unloadModule(name.c_str(), true);
    if (!ok)
        error =
            FormatString("Le module %s n'a pas pu être %s.", name.c_str(), option == "Load" ? "chargé" : "déchargé");
    return ok;
}

bool DocumentCommand(const std::string& rest, std::string& error)
{
    const std::vector<AcApDocument*> docs = OpenDocuments();
    if (rest.empty()) {
        if (docs.empty())
            acutPrintf("Aucun dessin ouvert.\n");
        for (std::size_t i = 0; i < docs.size(); ++i)
            acutPrintf("%s%zu %s\n", docs[i] == Current() ? "* " : "  ", i + 1, docs[i]->docTitle().c_str());
        return true;
    }
    AcApDocument* chosen = nullptr;
    if (std::optional<long long> n = ParseInt(rest); n && *n >= 1 && static_cast<std::size_t>(*n) <= docs.size())
        chosen = docs[static_cast<std::size_t>(*n - 1)];
    for (AcApDocument* d : docs)
        if (chosen == nullptr && (EqualsNoCase(d->docTitle(), rest) || EqualsNoCase(d->fileName(), rest)))
            chosen = d;
    if (chosen == nullptr) {
        error = FormatString("Aucun dessin ouvert ne s'appelle \"%s\" (numéro ou nom attendu).", rest.c_str());
        return false;
    }
    acDocManagerPtr()->activateDocument(chosen);
    acutPrintf("Dessin courant : %s\n", chosen->docTitle().c_str());
    return true;
}

} // namespace

std::string velModuleFileName(const std::string& name)
{
    const fs::path p(name);
    return p.extension().empty() ? name + ".arx" : name;
}

bool VelShell::openDrawing(const std::string& path, std::string& error)
{
    if (path.empty()) {
        acDocManagerPtr()->createDocument(std::make_unique<AcDbDatabase>(), "");
        return true;
    }
    const std::string full = fs::absolute(path).lexically_normal().string();
    for (AcApDocument* d : OpenDocuments())
        if (d->fileName() == full) {
            acDocManagerPtr()->activateDocument(d);
            acutPrintf("%s est déjà ouvert ; il devient le dessin courant.\n", full.c_str());
            return true;
        }
    std::unique_ptr<AcDbDatabase> database;
    if (const VelReadResult read = velOpenDrawing(full, database); !read) {
        error = read.description();
        return false;
    }
    acDocManagerPtr()->createDocument(std::move(database), full);
    acutPrintf("Dessin %s ouvert.\n", full.c_str());
    return true;
}

VelLineResult VelShell::runLine(const std::string& line, std::string& error)
{
    auto [command, rest] = SplitFirst(line);
    if (command.empty())
        return VelLineResult::kDone;
    bool ok = true;
    std::string arg;
    if (IsCommand(command, {"OPEN"})) {
        ok = Argument(rest, "Dessin à ouvrir : ", arg) && !arg.empty() ? openDrawing(arg, error) : true;
    } else if (IsCommand(command, {"NEW"})) {
        ok = openDrawing("", error);
    } else if (IsCommand(command, {"SAVE", "SAVEAS"})) {
        AcApDocument* doc = Current();
        if (doc == nullptr) {
            error = "Aucun dessin ouvert.";
            return VelLineResult::kFailed;
        }
        const bool as = IsCommand(command, {"SAVEAS"});
        std::string path = as ? std::string() : doc->fileName();
        if (path.empty() && !(Argument(rest, "Nom du fichier DXF : ", path) && !path.empty()))
            return VelLineResult::kDone;
        ok = SaveAs(doc, path, error);
    } else if (IsCommand(command, {"CLOSE"})) {
        if (Current() == nullptr) {
            error = "Aucun dessin ouvert.";
            return VelLineResult::kFailed;
        }
        ok = CloseDocument(Current(), true, error);
    } else if (IsCommand(command, {"QUIT"})) {
        for (AcApDocument* d : OpenDocuments())
            if (!CloseDocument(d, true, error))
                return VelLineResult::kFailed;
        return VelLineResult::kQuit;
    } else if (IsCommand(command, {"APPLOAD"})) {
        if (Argument(rest, "Module à charger : ", arg) && !arg.empty()) {
            ok = acrxDynamicLinker()->loadModule(velModuleFileName(arg).c_str(), true, true);
            if (!ok)
                error = FormatString("Le module %s n'a pas pu être chargé.", arg.c_str());
        }
    } else if (IsCommand(command, {"ARX"})) {
        ok = ArxCommand(rest, error);
    } else if (IsCommand(command, {"GETVAR"})) {
        if (Argument(rest, "Nom de la variable : ", arg) && !arg.empty()) {
            resbuf rb;
            if (acedGetVar(arg.c_str(), &rb) != RTNORM) {
                error = FormatString("Variable inconnue \"%s\" (ou sans valeur sans dessin ouvert).", arg.c_str());
                return VelLineResult::kFailed;
            }
            velRbClear(&rb);
            acutPrintf("%s = %s\n", arg.c_str(), velSysVarText(arg).c_str());
        }
    } else if (IsCommand(command, {"SETVAR"})) {
        auto [name, value] = SplitFirst(rest);
        std::string none;
        if (!Argument(name, "Nom de la variable : ", arg) || arg.empty())
            return VelLineResult::kDone;
        name = arg;
        if (!Argument(value, FormatString("Nouvelle valeur de %s : ", name.c_str()).c_str(), arg))
            return VelLineResult::kDone;
        ok = velSetSysVarText(name, arg, error) == RTNORM;
    } else if (IsCommand(command, {"DOCUMENT"})) {
        ok = DocumentCommand(rest, error);
    } else {
        velUI().pushPendingInput(Words(rest));
        const VelCommandResult result = velRunCommand(command, error);
        const std::size_t unused = velUI().dropPendingInput();
        if (result != VelCommandResult::kDone)
            return VelLineResult::kFailed;
        if (unused > 0) {
            error = FormatString("%zu réponse(s) en trop après la commande %s.", unused, command.c_str());
            return VelLineResult::kFailed;
        }
        return VelLineResult::kDone;
    }
    return ok ? VelLineResult::kDone : VelLineResult::kFailed;
}

int VelShell::run()
{
    VelUserInterface& ui = velUI();
    auto* script = dynamic_cast<VelScriptedUI*>(&ui);
    int status = 0;
    for (;;) {
        std::optional<VelInputLine> line = ui.readLine("\nCommande: ");
        if (!line) {
            if (ui.inputEnded())
                break;
            if (ui.endRequested()) {
                // Ctrl-D ends the session as QUIT does, asking about unsaved drawings.
                std::string error;
                if (runLine("QUIT", error) == VelLineResult::kQuit)
                    break;
                acutPrintf("%s\n", error.c_str());
                continue;
            }
            acutPrintf("*Annulé*\n");
            continue;
        }
        const int number = line->lineNumber;
        std::string error;
        const VelLineResult result = runLine(line->text, error);
        if (result == VelLineResult::kQuit)
            break;
        if (result == VelLineResult::kFailed) {
            if (error.empty())
                error = "la commande a échoué.";
            if (script != nullptr) {
                std::fflush(stdout);
                std::fprintf(stderr, "velhost: %s, ligne %d : %s\n", script->scriptName().c_str(), number,
                             error.c_str());
                status = 1;
                break;
            }
            acutPrintf("%s\n", error.c_str());
        }
    }
    // A script cut short by an input error did not run to its end.
    if (script != nullptr && status == 0 && !script->readResult()) {
        std::fflush(stdout);
        std::fprintf(stderr, "velhost: %s\n", script->readResult().description().c_str());
        status = 1;
    }
    shutdown();
    return status;
}

void VelShell::shutdown()
{
    std::string ignored;
    for (AcApDocument* d : OpenDocuments()) {
        if (d->database()->isModified())
            acutPrintf("Les modifications de %s ne sont pas enregistrées.\n", d->docTitle().c_str());
        CloseDocument(d, false, ignored);
    }
    velUnloadAllModules();
}

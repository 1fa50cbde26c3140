// velhost: the stand-in CAD host program. Opens a drawing, loads modules, then runs
// commands typed at the "Commande: " prompt or read from a script.
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <memory>
#include <string>
#include <vector>

#include "shell.h"
#include "text/text.hpp"
#include "velhost/editor.h"
#include "velhost/profile.h"
#include "velhost/rx.h"
#include "velhost/ui.h"

namespace fs = std::filesystem;

namespace {

constexpr const char* kUsage = "usage : velhost [--script FICHIER] [--load MODULE]... [--modules DOSSIER] "
                               "[--profile DOSSIER] [DESSIN]\n";

constexpr const char* kHelp =
    "\n"
    "Ouvre le dessin DXF (un dessin vide sans DESSIN), puis exécute les commandes tapées à\n"
    "l'invite « Commande: » ou lues dans un script.\n"
    "\n"
    "Options :\n"
    "  --script FICHIER   exécute les lignes du script (.scr) au lieu du clavier, puis se\n"
    "                     termine ; la première ligne en échec l'arrête\n"
    "  --load MODULE      charge MODULE (MODULE.arx) au démarrage ; l'option se répète\n"
    "  --modules DOSSIER  dossier des modules (par défaut, « modules » à côté du programme)\n"
    "  --profile DOSSIER  dossier du profil : paramètres, registre et historique des\n"
    "                     commandes (par défaut $XDG_CONFIG_HOME/velhost, sinon\n"
    "                     ~/.config/velhost)\n"
    "  -h, --help         affiche cette aide\n"
    "\n"
    "Commandes de l'hôte : OPEN, NEW, SAVE, SAVEAS, CLOSE, DOCUMENT, APPLOAD, ARX, SETVAR,\n"
    "GETVAR, QUIT ; puis celles des modules chargés (APPLOAD VelVuzazORE15, puis\n"
    "VelVuzazORE15 pour la liste des commandes du métré). Les réponses peuvent suivre la\n"
    "commande sur la même ligne : « SETVAR OSMODE 33 ».\n"
    "\n"
    "Au clavier :\n"
    "  Entrée             valide la réponse ; une réponse vide prend la valeur entre < >\n"
    "  Oui, Non...        une option se tape en entier ou par son début (« o », « Déc »)\n"
    "  Ctrl-C             annule la question en cours ; l'hôte continue\n"
    "  Ctrl-D             sur une ligne vide, à l'invite « Commande: », termine comme QUIT\n"
    "                     (les dessins modifiés sont proposés à l'enregistrement) ;\n"
    "                     ailleurs, annule la question\n"
    "  Haut, Bas, Ctrl-R  rappellent les lignes déjà tapées, gardées d'une session à l'autre\n"
    "                     dans le fichier « historique » du profil\n"
    "  Ctrl-A, Ctrl-E     début, fin de la ligne (édition à la manière d'Emacs)\n"
    "  Un message attend Entrée, qui choisit son bouton [OK] ou celui entre < > ; pour un\n"
    "  autre bouton, tapez son nom ou sa première lettre.\n"
    "\n"
    "ZodEVIBdrPrix ouvre le bordereau dans l'éditeur de $VISUAL, sinon $EDITOR (à défaut\n"
    "sensible-editor, nano ou vi) : enregistrez et quittez pour valider.\n"
    "\n"
    "ZodEVICreate ouvre le dialogue « Quantités à prendre en compte » sur tout l'écran\n"
    "(80 colonnes sur 12 lignes au moins ; un script le pilote par des lignes) :\n"
    "  Haut, Bas, Pg. préc., Pg. suiv., Début, Fin   se déplacent dans l'arbre\n"
    "  Droite, Gauche, +, -  ouvrent ou ferment une catégorie\n"
    "  Espace             coche ou décoche l'élément choisi ; sur un bouton, l'appuie\n"
    "  Tab, Maj-Tab       passent au contrôle suivant, précédent ; Entrée fait comme Tab\n"
    "                     et ne valide jamais\n"
    "  Échap, Ctrl-C      comme « Quitter »\n"
    "  La souris coche (clic sur la case), choisit (clic sur le texte), ouvre ou ferme\n"
    "  (clic sur ▾ ▸), fait défiler (molette) et appuie sur les boutons.\n"
    "\n"
    "Code de retour : 0 ; 1 quand le dessin ou un module de --load ne s'ouvre pas, ou\n"
    "après une ligne de script en échec ; 2 pour une option ou un script illisible ; 3\n"
    "après un arrêt fatal d'un module.\n";

struct Options {
    std::string script;
    std::vector<std::string> modules;
    std::string modulesDir;
    std::string profileDir;
    std::string drawing;
    bool help = false;
};

bool ParseArguments(int argc, char** argv, Options& options, std::string& error)
{
    for (int i = 1; i < argc; ++i) {
        const std::string arg = argv[i];
        auto value = [&](std::string& out) {
            if (i + 1 >= argc) {
                error = FormatString("l'option %s attend une valeur.", arg.c_str());
                return false;
            }
            out = argv[++i];
            return true;
        };
        if (arg == "--script") {
            if (!value(options.script))
                return false;
        } else if (arg == "--load") {
            std::string m;
            if (!value(m))
                return false;
            options.modules.push_back(m);
        } else if (arg == "--modules") {
            if (!value(options.modulesDir))
                return false;
        } else if (arg == "--profile") {
            if (!value(options.profileDir))
                return false;
        } else if (arg == "--help" || arg == "-h") {
            options.help = true;
        } else if (arg.size() > 1 && arg.front() == '-') {
            error = FormatString("option inconnue %s.", arg.c_str());
            return false;
        } else if (!options.drawing.empty()) {
            error = FormatString("un seul dessin attendu, \"%s\" est de trop.", arg.c_str());
            return false;
        } else {
            options.drawing = arg;
        }
    }
    return true;
}

// The "modules" folder beside the program (build/bin/velhost -> build/modules).
std::string DefaultModulesDir()
{
    std::error_code ec;
    const fs::path exe = fs::read_symlink("/proc/self/exe", ec);
    if (ec)
        return "modules";
    const fs::path beside = exe.parent_path() / "modules";
    if (fs::is_directory(beside, ec))
        return beside.string();
    return (exe.parent_path().parent_path() / "modules").string();
}

} // namespace

int main(int argc, char** argv)
{
    Options options;
    std::string error;
    if (!ParseArguments(argc, argv, options, error)) {
        std::fprintf(stderr, "velhost : %s\n%s", error.c_str(), kUsage);
        return 2;
    }

    if (options.help) {
        std::fputs(kUsage, stdout);
        std::fputs(kHelp, stdout);
        return 0;
    }

    VelHostSettings& settings = velHostSettings();
    settings.modulesDir = fs::absolute(options.modulesDir.empty() ? DefaultModulesDir() : options.modulesDir).string();
    if (!options.profileDir.empty()) {
        settings.profileDir = fs::absolute(options.profileDir).string();
        settings.profileName = fs::path(settings.profileDir).filename().string();
    }

    std::ifstream scriptFile;
    std::unique_ptr<VelUserInterface> ui;
    VelTerminalUI* terminal = nullptr;
    const std::string historyFile = (fs::path(settings.profileDir) / "historique").string();
    if (!options.script.empty()) {
        scriptFile.open(options.script, std::ios::binary);
        if (!scriptFile) {
            std::fprintf(stderr, "velhost : impossible de lire le script %s.\n", options.script.c_str());
            return 2;
        }
        ui = std::make_unique<VelScriptedUI>(scriptFile, std::cout, options.script);
    } else if (isatty(STDIN_FILENO)) {
        terminal = new VelTerminalUI(std::cin, std::cout, true);
        ui.reset(terminal);
        terminal->loadHistory(historyFile);
    } else {
        ui = std::make_unique<VelScriptedUI>(std::cin, std::cout, "<entrée standard>");
    }
    velSetUI(ui.get());
    auto saveHistory = [&] {
        if (terminal == nullptr)
            return;
        std::error_code ec;
        fs::create_directories(settings.profileDir, ec);
        if (!terminal->saveHistory(historyFile))
            std::fprintf(stderr, "velhost : impossible d'écrire l'historique %s.\n", historyFile.c_str());
    };

    // A fatal error ends the process at once: modules are in an unknown state, so none of
    // their code runs again (no unload, no static destructors). The lines typed so far are
    // kept: they are what the user needs to run again.
    auto* script = dynamic_cast<VelScriptedUI*>(ui.get());
    velSetAbortHandler([script, &saveHistory](const std::string& message) {
        saveHistory();
        std::fflush(stdout);
        if (script != nullptr)
            std::fprintf(stderr, "velhost: %s, ligne %d : arrêt fatal : %s\n", script->scriptName().c_str(),
                         script->currentLine(), message.c_str());
        else
            std::fprintf(stderr, "velhost : arrêt fatal : %s\n", message.c_str());
        std::fflush(stderr);
        std::_Exit(3);
    });

    if (const VelReadResult registry = velCheckRegistry(); !registry)
        acutPrintf("%s\n", registry.description().c_str());

    VelShell shell;
    int status = 0;
    if (!shell.openDrawing(options.drawing, error)) {
        std::fprintf(stderr, "velhost : %s\n", error.c_str());
        velSetUI(nullptr);
        return 1;
    }
    for (const std::string& m : options.modules) {
        if (!acrxLoadModule(velModuleFileName(m).c_str(), true, true)) {
            std::fprintf(stderr, "velhost : le module %s n'a pas pu être chargé.\n", m.c_str());
            shell.shutdown();
            velSetUI(nullptr);
            return 1;
        }
    }
    status = shell.run();
    saveHistory();
    velSetUI(nullptr);
    return status;
}

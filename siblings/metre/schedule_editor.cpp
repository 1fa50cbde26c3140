// Running the schedule's editor through the host's user interface.
#include "schedule_editor.hpp"

#include "text/text.hpp"
#include "velhost/editor.h"
#include "velhost/files.h"
#include "velhost/ui.h"

#include <algorithm>
#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <sys/wait.h>
#include <unistd.h>

namespace metre {

namespace {

bool OnPath(const std::string& program)
{
    const char* path = std::getenv("PATH");
    std::string_view rest = path ? path : "/usr/bin:/bin";
    while (!rest.empty()) {
        const std::size_t colon = rest.find(':');
        const std::string folder(rest.substr(0, colon));
        rest = colon == std::string_view::npos ? std::string_view() : rest.substr(colon + 1);
        if (!folder.empty() && ::access((folder + "/" + program).c_str(), X_OK) == 0)
            return true;
    }
    return false;
}

std::string ReadWholeFile(const std::string& path, bool& ok)
{
    std::ifstream in(path, std::ios::binary);
    std::ostringstream content;
    ok = in.is_open();
    if (ok)
        content << in.rdbuf();
    return content.str();
}

// The first word of a script line and the rest after one blank.
std::pair<std::string, std::string> SplitVerb(const std::string& line)
{
    const std::size_t start = line.find_first_not_of(" \t");
    if (start == std::string::npos)
        return {};
    const std::size_t blank = line.find_first_of(" \t", start);
    if (blank == std::string::npos)
        return {line.substr(start), {}};
    const std::size_t rest = line.find_first_not_of(" \t", blank);
    std::string argument = rest == std::string::npos ? std::string() : line.substr(rest);
    while (!argument.empty() && (argument.back() == ' ' || argument.back() == '\t' || argument.back() == '\r'))
        argument.pop_back();
    return {line.substr(start, blank - start), argument};
}

void ScriptError(const VelInputLine& line, const std::string& what)
{
    acutPrintf("Bordereau, ligne %d du script : %s ; rien n'est modifié.\n", line.lineNumber, what.c_str());
}

// The session's changes made on a newer version of the file: deletions and additions by
// tree path, modifications field by field, so that what another user changed in the same
// article stays unless the session changed that very field. The changes then carry the
// articles as written.
ArticleVector Rebase(const ArticleVector& original, ArticleVector newer, std::vector<ScheduleChange>& changes)
{
    const auto find = [&](const std::string& treePath) {
        return std::find_if(newer.begin(), newer.end(),
                            [&](const auto& article) { return EqualsNoCase(article->treePath, treePath); });
    };
    for (ScheduleChange& change : changes) {
        const auto there = find(change.article->treePath);
        if (change.kind == kEditDeleted) {
            if (there != newer.end())
                newer.erase(there);
            continue;
        }
        const auto before = std::find_if(original.begin(), original.end(), [&](const auto& article) {
            return EqualsNoCase(article->treePath, change.article->treePath);
        });
        if (there == newer.end()) {
            newer.push_back(std::make_unique<CZodEVIArticle>(*change.article));
            continue;
        }
        if (change.kind == kEditModified && before != original.end()) {
            for (const CZodEVIArticleField& field : ArticleFields())
                if (FieldText(**before, field) != FieldText(*change.article, field))
                    SetFieldText(**there, field, FieldText(*change.article, field));
        } else {
            **there = *change.article;
        }
        *change.article = **there;
    }
    return newer;
}

// Writes the session under the file's lock, unless another program changed the file since
// the session read it: a script stops there; a user chooses between making the changes
// again on the newer version and replacing it.
bool WriteSession(const std::string& path, VelFileIdentity opened, const ScheduleEdit& edit,
                  std::vector<ScheduleChange>& changes)
{
    std::vector<const CZodEVIArticle*> result = edit.Result();
    ArticleVector newer;
    for (;;) {
        VelFileIdentity now;
        {
            const VelFileLock lock(path);
            if (!lock.locked()) {
                acutPrintf("Bordereau : %s\n", lock.result().message.c_str());
                return false;
            }
            now = velFileIdentity(path);
            if (opened.sameContent(now)) {
                if (VelReadResult written = WriteScheduleFile(path, result); !written) {
                    acutPrintf("%s\n", written.description().c_str());
                    return false;
                }
                return true;
            }
        }
        if (velUI().isScripted()) {
            acutPrintf("Bordereau « %s » : modifié par un autre utilisateur ou programme pendant la saisie ; les "
                       "modifications de la saisie ne sont pas enregistrées, pour ne pas perdre les siennes. "
                       "Rouvrez le bordereau, puis recommencez.\n",
                       path.c_str());
            return false;
        }
        acutPrintf("Bordereau « %s » : modifié par un autre utilisateur ou programme pendant la saisie.\n",
                   path.c_str());
        acedInitGet(0, "Oui Non");
        std::string answer;
        const int status = acedGetKword(
            "Reporter vos modifications sur sa nouvelle version (Non : la remplacer) ? [Oui/Non] <Oui> : ", answer);
        if (status != RTNORM && status != RTNONE) {
            acutPrintf("Bordereau « %s » : rien n'est enregistré.\n", path.c_str());
            return false;
        }
        if (status == RTNORM && answer == "Non") {
            opened = now;
            continue;
        }
        ArticleVector fresh;
        opened = velFileIdentity(path);
        if (VelReadResult read = ReadScheduleFile(path, fresh); !read) {
            acutPrintf("%s\nBordereau « %s » : rien n'est enregistré.\n", read.description().c_str(), path.c_str());
            return false;
        }
        newer = Rebase(edit.Original(), std::move(fresh), changes);
        result.assign(newer.size(), nullptr);
        std::transform(newer.begin(), newer.end(), result.begin(), [](const auto& article) { return article.get(); });
    }
}

} // namespace

std::string TextEditorCommand()
{
    for (const char* variable : {"VISUAL", "EDITOR"}) {
        const char* value = std::getenv(variable);
        if (value != nullptr && *value != '\0')
            return value;
    }
    for (const char* program : {"sensible-editor", "editor", "nano", "vi"})
        if (OnPath(program))
            return program;
    return "vi";
}

bool RunTextEditor(const std::string& file, int line, std::string& error)
{
    const std::string command = TextEditorCommand();
    // The editor command is the user's own shell text; the file only ever travels as an
    // argument, never inside the command.
    const std::string script = command + " \"$@\"";
    const std::string position = FormatString("+%d", line);
    // The table is UTF-8: the editor must read and write it so, whatever the user's locale.
    const std::vector<std::string> environment = velTerminalProgramEnvironment();
    std::vector<char*> envp;
    for (const std::string& entry : environment)
        envp.push_back(const_cast<char*>(entry.c_str()));
    envp.push_back(nullptr);
    const char* const argv[] = {"sh", "-c", script.c_str(), "sh", position.c_str(), file.c_str(), nullptr};
    const pid_t child = ::fork();
    if (child < 0) {
        error = FormatString("impossible de lancer l'éditeur « %s » (%s)", command.c_str(), std::strerror(errno));
        return false;
    }
    if (child == 0) {
        ::execve("/bin/sh", const_cast<char* const*>(argv), envp.data());
        ::_exit(127);
    }
    int status = 0;
    while (::waitpid(child, &status, 0) < 0) {
        if (errno != EINTR) {
            error = FormatString("l'éditeur « %s » est perdu (%s)", command.c_str(), std::strerror(errno));
            return false;
        }
    }
    if (!WIFEXITED(status) || WEXITSTATUS(status) != 0) {
        error = WIFEXITED(status) && WEXITSTATUS(status) == 127
                    ? FormatString("l'éditeur « %s » est introuvable", command.c_str())
                    : FormatString("l'éditeur « %s » s'est terminé en erreur (%d)", command.c_str(),
                                   WIFEXITED(status) ? WEXITSTATUS(status) : -1);
        return false;
    }
    return true;
}

bool RunScriptedSession(ScheduleEdit& edit, const std::string& treePath)
{
    if (!treePath.empty())
        acutPrintf("Bordereau : article %s\n", treePath.c_str());
    for (;;) {
        const std::optional<VelInputLine> line = velUI().readLine("Bordereau [supprimer/ajouter/champ/fin/annuler] : ");
        if (!line) {
            acutPrintf("Bordereau : saisie interrompue avant « fin » ; rien n'est modifié.\n");
            return false;
        }
        const auto [verb, argument] = SplitVerb(line->text);
        std::string error;
        if (verb.empty())
            continue;
        if (EqualsNoCase(verb, "fin")) {
            if (!edit.Validate(error)) {
                ScriptError(*line, error);
                return false;
            }
            return true;
        }
        if (EqualsNoCase(verb, "annuler"))
            return false;
        if (EqualsNoCase(verb, "supprimer")) {
            if (!edit.Delete(argument, error)) {
                ScriptError(*line, error);
                return false;
            }
        } else if (EqualsNoCase(verb, "ajouter")) {
            if (!edit.Add(argument, error)) {
                ScriptError(*line, error);
                return false;
            }
        } else if (EqualsNoCase(verb, "champ")) {
            const auto [field, path] = SplitVerb(argument);
            if (field.empty() || path.empty()) {
                ScriptError(*line, "« champ <nom> <chemin> » attendu");
                return false;
            }
            const std::optional<VelInputLine> value = velUI().readLine(FormatString("Valeur de %s : ", field.c_str()));
            if (!value) {
                ScriptError(*line, FormatString("valeur du champ « %s » attendue", field.c_str()));
                return false;
            }
            if (!edit.SetField(path, field, DecodeTableValue(value->text), error)) {
                ScriptError(*value, error);
                return false;
            }
        } else {
            ScriptError(*line, FormatString("« supprimer », « ajouter », « champ », « fin » ou « annuler » attendu, "
                                            "« %s » trouvé",
                                            verb.c_str()));
            return false;
        }
    }
}

bool RunTerminalSession(ScheduleEdit& edit, const std::string& path, const std::string& treePath)
{
    int line = 1;
    std::string text = ScheduleTable(edit.Original(), path, treePath, line);
    std::string table = (std::filesystem::temp_directory_path() / "bordereau-XXXXXX.txt").string();
    const int fd = ::mkstemps(table.data(), 4);
    if (fd < 0) {
        acutPrintf("Bordereau : impossible de préparer le tableau (%s).\n", std::strerror(errno));
        return false;
    }
    ::close(fd);
    struct Remover {
        std::string file;
        ~Remover() { ::unlink(file.c_str()); }
    } remover{table};
    for (;;) {
        {
            std::ofstream out(table, std::ios::binary | std::ios::trunc);
            out << text;
            if (!out) {
                acutPrintf("Bordereau : impossible d'écrire le tableau %s.\n", table.c_str());
                return false;
            }
        }
        std::string error;
        if (!RunTextEditor(table, line, error)) {
            acutPrintf("Bordereau : %s ; rien n'est modifié.\n", error.c_str());
            return false;
        }
        bool ok = false;
        text = ReadWholeFile(table, ok);
        if (!ok) {
            acutPrintf("Bordereau : le tableau %s a disparu ; rien n'est modifié.\n", table.c_str());
            return false;
        }
        if (ParseScheduleTable(text, table, edit, error, line))
            return true;
        acutPrintf("%s\n", error.c_str());
        acedInitGet(0, "Oui Non");
        std::string answer;
        const int status = acedGetKword("Corriger le tableau ? [Oui/Non] <Oui> : ", answer);
        if (status == RTCAN || (status == RTNORM && answer == "Non"))
            return false;
    }
}

int EditScheduleFile(const std::string& path, const std::string& treePath, std::vector<CZodEVIArticle*>* records,
                     std::vector<std::uint32_t>* actions)
{
    if (records == nullptr || actions == nullptr)
        return 2;
    const VelFileIdentity opened = velFileIdentity(path);
    ArticleVector articles;
    if (VelReadResult read = ReadScheduleFile(path, articles); !read) {
        acutPrintf("%s\n", read.description().c_str());
        return 2;
    }
    ScheduleEdit edit(articles);
    const bool validated =
        velUI().isScripted() ? RunScriptedSession(edit, treePath) : RunTerminalSession(edit, path, treePath);
    if (!validated)
        return 1;
    std::vector<ScheduleChange> changes = edit.Changes();
    if (changes.empty()) {
        // Looked at and closed: the editor ran normally.
        acutPrintf("Bordereau « %s » : aucune modification.\n", path.c_str());
        return 0;
    }
    if (!WriteSession(path, opened, edit, changes))
        return 3;
    int counts[4] = {};
    for (ScheduleChange& change : changes) {
        ++counts[change.kind];
        records->push_back(change.article.release());
        actions->push_back(change.kind);
    }
    acutPrintf("Bordereau « %s » : %d article(s) supprimé(s), %d modifié(s), %d ajouté(s).\n", path.c_str(), counts[1],
               counts[2], counts[3]);
    return 0;
}

} // namespace metre

// Editing sessions: the change list from table and script edits, renames reported as a
// deletion and an addition, refused tables and scripts, and the terminal editor run on a
// real file through $VISUAL.
#include "schedule_edit.hpp"
#include "schedule_editor.hpp"

#include "support/session.hpp"
#include "support/temp_dir.hpp"
#include "velhost/ui.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <filesystem>
#include <functional>
#include <utility>
#include <sstream>

namespace {

using metre::ArticleVector;

const std::string kTuyau = "Réseaux\\\\EU1\\\\Linéaire\\\\EU-001 - Tuyau";
const std::string kRegard = "Réseaux\\\\EU1\\\\Ponctuel\\\\EU-002 - Regard";

ArticleVector Schedule()
{
    ArticleVector articles;
    for (const auto& [code, designation, path, nature] :
         {std::tuple{"EU-001", "Tuyau", kTuyau, 2}, std::tuple{"EU-002", "Regard", kRegard, 1}}) {
        articles.push_back(std::make_unique<CZodEVIArticle>(CZodEVIArticle{.code = code,
                                                                           .unitPrice = 12.5,
                                                                           .nature = nature,
                                                                           .designation = designation,
                                                                           .description = "Ligne 1\r\nLigne 2",
                                                                           .groupKey = "PRJ_RES(EU1)",
                                                                           .treePath = path}));
    }
    return articles;
}

std::vector<std::pair<std::uint32_t, std::string>> Summary(const metre::ScheduleEdit& edit)
{
    std::vector<std::pair<std::uint32_t, std::string>> out;
    for (const metre::ScheduleChange& change : edit.Changes())
        out.emplace_back(change.kind, change.article->treePath);
    return out;
}

using Changes = std::vector<std::pair<std::uint32_t, std::string>>;

TEST(ScheduleEdit, ValuesSurviveTheTable)
{
    for (const std::string& value : {std::string("a\r\nb\tc"), kTuyau, std::string("fin\\"), std::string("\\\\n")}) {
        SCOPED_TRACE(value);
        EXPECT_EQ(metre::DecodeTableValue(metre::EncodeTableValue(value)), value);
    }
    EXPECT_EQ(metre::DecodeTableValue("Ligne 1\\r\\nLigne 2"), "Ligne 1\r\nLigne 2");
}

TEST(ScheduleEdit, UntouchedTableChangesNothing)
{
    const ArticleVector articles = Schedule();
    int line = 0;
    const std::string table = metre::ScheduleTable(articles, "b.xml", kRegard, line);
    std::istringstream lines(table);
    std::string text;
    for (int i = 0; i < line; ++i)
        std::getline(lines, text);
    EXPECT_EQ(text, "[article 2]") << "the editor opens on the asked article";
    metre::ScheduleEdit edit(articles);
    std::string error;
    int errorLine = 0;
    ASSERT_TRUE(metre::ParseScheduleTable(table, "t", edit, error, errorLine)) << error;
    EXPECT_TRUE(edit.Changes().empty());
}

TEST(ScheduleEdit, TableEditsBecomeChanges)
{
    const ArticleVector articles = Schedule();
    int line = 0;
    std::string table = metre::ScheduleTable(articles, "b.xml", "", line);
    // Article 1 gets a new price, article 2 is deleted, one is added.
    table.replace(table.find("unitPrice = 12.5"), 16, "unitPrice = 14");
    table.erase(table.find("[article 2]"));
    table += "[nouveau]\ntreePath = Réseaux\\\\EU1\\\\Ponctuel\\\\EU-003 - Tampon\nunitPrice = 80\n";
    metre::ScheduleEdit edit(articles);
    std::string error;
    int errorLine = 0;
    ASSERT_TRUE(metre::ParseScheduleTable(table, "t", edit, error, errorLine)) << error;
    EXPECT_EQ(Summary(edit),
              (Changes{{1, kRegard}, {2, kTuyau}, {3, "Réseaux\\\\EU1\\\\Ponctuel\\\\EU-003 - Tampon"}}));
    const std::vector<const CZodEVIArticle*> result = edit.Result();
    ASSERT_EQ(result.size(), 2u);
    EXPECT_EQ(result[0]->unitPrice, 14);
    EXPECT_EQ(result[1]->code, "EU-003");
    EXPECT_EQ(result[1]->designation, "Tampon");
    EXPECT_EQ(result[1]->nature, 1);
    EXPECT_EQ(result[1]->groupKey, "0");
}

TEST(ScheduleEdit, RenameIsDeletionAndAddition)
{
    const ArticleVector articles = Schedule();
    metre::ScheduleEdit edit(articles);
    std::string error;
    ASSERT_TRUE(edit.SetField(kTuyau, "designation", "Tuyau PVC", error));
    ASSERT_TRUE(edit.SetField("Réseaux\\\\EU1\\\\Linéaire\\\\EU-001 - Tuyau PVC", "nature", "1", error));
    const std::string renamed = "Réseaux\\\\EU1\\\\Ponctuel\\\\EU-001 - Tuyau PVC";
    EXPECT_EQ(Summary(edit), (Changes{{1, kTuyau}, {3, renamed}}));
    EXPECT_EQ(edit.Changes().back().article->groupKey, "PRJ_RES(EU1)") << "the added copy keeps its group";
}

TEST(ScheduleEdit, BadTablesAreRefusedWithTheirLine)
{
    const ArticleVector articles = Schedule();
    int line = 0;
    const std::string table = metre::ScheduleTable(articles, "b.xml", "", line);
    struct Case {
        const char* name;
        std::string text;
        const char* expected;
    } cases[] = {
        {"unknown field", "[article 1]\nprix = 3\n", "ligne 2 : champ inconnu « prix »"},
        {"bad number", "[article 1]\nunitPrice = 12,5\n", "ligne 2 : champ « unitPrice » : nombre attendu, « 12,5 »"},
        {"twice", "[article 1]\n[article 1]\n", "ligne 2 : l'article 1 figure deux fois"},
        {"out of range", "[article 3]\n", "ligne 1 : en-tête « [article N] » (N de 1 à 2)"},
        {"field first", "code = A\n", "ligne 1 : en-tête de bloc"},
        {"new without path", "[article 1]\n\n[nouveau]\ncode = X\n",
         "ligne 3 : un nouvel article demande le champ treePath"},
        {"same path", table + "[nouveau]\ntreePath = " + kTuyau + "\n", "deux articles ont le chemin"},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        metre::ScheduleEdit edit(articles);
        std::string error;
        int errorLine = 0;
        EXPECT_FALSE(metre::ParseScheduleTable(c.text, "t.txt", edit, error, errorLine));
        EXPECT_NE(error.find("Tableau « t.txt »"), std::string::npos) << error;
        EXPECT_NE(error.find(c.expected), std::string::npos) << error;
    }
}

class ScheduleEditor : public ::testing::Test {
protected:
    void SetUp() override
    {
        path = dir.File("VelaBordereau.xml");
        const ArticleVector articles = Schedule();
        std::vector<const CZodEVIArticle*> pointers;
        for (const auto& a : articles)
            pointers.push_back(a.get());
        ASSERT_TRUE(metre::WriteScheduleFile(path, pointers));
        original = dir.Read("VelaBordereau.xml");
    }
    // Runs the editor with a script as the user's input.
    int Run(const std::string& lines, const std::string& treePath = "")
    {
        std::istringstream script(lines);
        VelScriptedUI ui(script, output, "edit.scr");
        VelUserInterface* previous = velSetUI(&ui);
        const int answer = metre::EditScheduleFile(path, treePath, &records, &actions);
        velSetUI(previous);
        return answer;
    }
    void TearDown() override
    {
        for (CZodEVIArticle* a : records)
            delete a;
    }
    TempDir dir;
    std::string path, original;
    std::ostringstream output;
    std::vector<CZodEVIArticle*> records;
    std::vector<std::uint32_t> actions;
};

TEST_F(ScheduleEditor, ScriptDeletesAddsAndSetsFields)
{
    const std::string added = "Réseaux\\\\EU1\\\\Ponctuel\\\\EU-003 - Tampon";
    ASSERT_EQ(Run("supprimer " + kRegard + "\najouter " + added + "\nchamp unitPrice " + added +
                  "\n80.5\nchamp description " + added + "\nFonte\\r\\nD400\nfin\n"),
              0)
        << output.str();
    ASSERT_EQ(actions, (std::vector<std::uint32_t>{1, 3}));
    EXPECT_EQ(records[0]->treePath, kRegard);
    EXPECT_EQ(records[1]->unitPrice, 80.5);
    EXPECT_EQ(records[1]->description, "Fonte\r\nD400");
    ArticleVector now;
    ASSERT_TRUE(metre::ReadScheduleFile(path, now));
    ASSERT_EQ(now.size(), 2u);
    EXPECT_EQ(now[1]->treePath, added);
    EXPECT_EQ(dir.Read("VelaBordereau.xml.bak"), original);
    EXPECT_NE(output.str().find("1 article(s) supprimé(s), 0 modifié(s), 1 ajouté(s)"), std::string::npos);
}

TEST_F(ScheduleEditor, ScriptThatQuitsOrFailsLeavesTheFile)
{
    struct Case {
        const char* name;
        std::string script;
        int answer;
        const char* expected;
    } cases[] = {
        {"cancelled", "supprimer " + kRegard + "\nannuler\n", 1, ""},
        {"looked at only: closed normally", "fin\n", 0, "aucune modification"},
        {"input ends", "supprimer " + kRegard + "\n", 1, "saisie interrompue"},
        {"unknown article", "supprimer X\\\\Y - Z\nfin\n", 1, "ligne 1 du script : aucun article « X\\\\Y - Z »"},
        {"bad value", "champ unitPrice " + kTuyau + "\ndouze\nfin\n", 1,
         "ligne 2 du script : champ « unitPrice » : nombre"},
        {"unknown verb", "\nrenommer A\n", 1, "ligne 2 du script : « supprimer », « ajouter »"},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        output.str("");
        EXPECT_EQ(Run(c.script), c.answer);
        EXPECT_NE(output.str().find(c.expected), std::string::npos) << output.str();
        EXPECT_TRUE(records.empty());
        EXPECT_EQ(dir.Read("VelaBordereau.xml"), original);
        EXPECT_FALSE(std::filesystem::exists(path + ".bak"));
    }
}

TEST_F(ScheduleEditor, UnreadableScheduleIsReported)
{
    dir.Write("VelaBordereau.xml", "<devis/>");
    EXPECT_EQ(Run("fin\n"), 2);
    EXPECT_NE(output.str().find("n'est pas un bordereau"), std::string::npos) << output.str();
}

TEST_F(ScheduleEditor, TerminalEditorEditsTheTable)
{
    // The "user" changes the price of the article the editor was opened on, and records
    // the line it was opened at.
    const std::string editor = dir.Write("editor.sh", "#!/bin/sh\n"
                                                      "echo \"$1\" > \"$(dirname \"$0\")/position\"\n"
                                                      "sed -i 's/^unitPrice = 12.5$/unitPrice = 99/' \"$2\"\n");
    std::filesystem::permissions(editor, std::filesystem::perms::owner_all);
    setenv("VISUAL", editor.c_str(), 1);
    const int answer = [&] {
        const TerminalAnswers terminal("");
        return metre::EditScheduleFile(path, kRegard, &records, &actions);
    }();
    unsetenv("VISUAL");
    ASSERT_EQ(answer, 0);
    EXPECT_EQ(actions, (std::vector<std::uint32_t>{2, 2}));
    EXPECT_EQ(records.at(1)->unitPrice, 99);
    EXPECT_EQ(dir.Read("position"), "+57\n") << "the line of [article 2]";
    ArticleVector now;
    ASSERT_TRUE(metre::ReadScheduleFile(path, now));
    EXPECT_EQ(now.at(0)->unitPrice, 99);
    EXPECT_EQ(now.at(0)->description, "Ligne 1\r\nLigne 2");
}

TEST_F(ScheduleEditor, TerminalEditorThatFailsChangesNothing)
{
    setenv("VISUAL", "false", 1);
    const TerminalAnswers terminal("");
    EXPECT_NE(metre::EditScheduleFile(path, "", &records, &actions), 0);
    unsetenv("VISUAL");
    EXPECT_NE(terminal.output.str().find("s'est terminé en erreur"), std::string::npos) << terminal.output.str();
    EXPECT_EQ(dir.Read("VelaBordereau.xml"), original);
}

// A scripted session during which another user saves the schedule.
class InterruptedScript : public VelScriptedUI {
public:
    using VelScriptedUI::VelScriptedUI;
    std::function<void()> meanwhile;

protected:
    std::optional<VelInputLine> readRawLine(const std::string& prompt) override
    {
        if (meanwhile)
            std::exchange(meanwhile, nullptr)();
        return VelScriptedUI::readRawLine(prompt);
    }
};

TEST_F(ScheduleEditor, FileSavedByAnotherUserDuringTheSessionIsNotLost)
{
    // The other user prices the pipe at 7; the session prices the manhole at 99.
    const std::string theirs = [&] {
        std::string text = original;
        text.replace(text.find("unitPrice=\"12.5\""), 16, "unitPrice=\"7\"");
        return text;
    }();
    const std::string editor =
        dir.Write("editor.sh", "#!/bin/sh\n"
                               "sed -i '0,/unitPrice=\"12.5\"/s//unitPrice=\"7\"/' '" +
                                   path + "'\nsed -i ':a;N;$!ba;s/unitPrice = 12.5/unitPrice = 99/2' \"$2\"\n");
    std::filesystem::permissions(editor, std::filesystem::perms::owner_all);
    struct Case {
        const char* name;
        const char* answer; // null: a script
        int status;
        double pipe, manhole;
    } cases[] = {
        {"script", nullptr, 3, 7, 12.5},
        {"the session's changes made on the newer version", "Oui\n", 0, 7, 99},
        {"replaced", "Non\n", 0, 12.5, 99},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        dir.Write("VelaBordereau.xml", original);
        output.str("");
        int status = 0;
        if (c.answer == nullptr) {
            std::istringstream script("champ unitPrice " + kRegard + "\n99\nfin\n");
            InterruptedScript ui(script, output, "edit.scr");
            ui.meanwhile = [&] { dir.Write("VelaBordereau.xml", theirs); };
            VelUserInterface* previous = velSetUI(&ui);
            status = metre::EditScheduleFile(path, "", &records, &actions);
            velSetUI(previous);
        } else {
            setenv("VISUAL", editor.c_str(), 1);
            std::istringstream in(c.answer);
            VelTerminalUI ui(in, output, false);
            VelUserInterface* previous = velSetUI(&ui);
            status = metre::EditScheduleFile(path, "", &records, &actions);
            velSetUI(previous);
            unsetenv("VISUAL");
        }
        EXPECT_EQ(status, c.status) << output.str();
        EXPECT_NE(output.str().find("modifié par un autre utilisateur ou programme pendant la saisie"),
                  std::string::npos)
            << output.str();
        ArticleVector now;
        ASSERT_TRUE(metre::ReadScheduleFile(path, now));
        ASSERT_EQ(now.size(), 2u);
        EXPECT_EQ(now[0]->unitPrice, c.pipe);
        EXPECT_EQ(now[1]->unitPrice, c.manhole);
        if (c.status == 0) {
            ASSERT_FALSE(records.empty());
            EXPECT_EQ(records.back()->unitPrice, 99) << "the caller mirrors the article as written";
        }
    }
}

} // namespace

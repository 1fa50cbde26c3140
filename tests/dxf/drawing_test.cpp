// Tests of whole drawings: the fixtures written by ezdxf, byte-for-byte rewriting, what
// changes when the host writes, and the refusal of malformed files.
#include "host/dxf/drawing.hpp"

#include <gtest/gtest.h>

#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <sstream>

#include "../host/file_faults.hpp"
#include "support/temp_dir.hpp"
#include "velhost/dbase.h"

namespace {

using vel::dxf::FormatHandle;

std::string Fixture(const char* name)
{
    return std::string(VEL_TEST_DATA) + "/dxf/" + name;
}

std::unique_ptr<AcDbDatabase> Open(const std::string& path)
{
    std::unique_ptr<AcDbDatabase> db;
    EXPECT_EQ(velOpenDrawing(path, db).description(), "");
    return db;
}

std::string Written(AcDbDatabase& db)
{
    std::string out;
    std::string error;
    EXPECT_TRUE(velWriteDrawing(db, out, error)) << error;
    return out;
}

TEST(Drawing, FixturesReadAndWriteBackByteForByte)
{
    const struct {
        const char* file;
        const char* version;
        int osmode;
        const char* clayer;
        std::size_t layers;
    } cases[] = {
        {"r12.dxf", "AC1009", 33, "0", 3},        {"r2000.dxf", "AC1015", 37, "RESEAU_EP", 3},
        {"r2004_1252.dxf", "AC1018", 37, "0", 4}, {"r2018.dxf", "AC1032", 37, "0", 3},
        {"crlf.dxf", "AC1032", 37, "0", 3},       {"r2018_bin.dxf", "AC1032", 37, "0", 3},
        {"r12_bin.dxf", "AC1009", 20583, "0", 3},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.file);
        auto db = Open(Fixture(c.file));
        ASSERT_TRUE(db);
        EXPECT_EQ(db->dxfVersion(), c.version);
        EXPECT_EQ(db->osmode(), c.osmode);
        EXPECT_EQ(db->layerName(db->clayer()), c.clayer);
        EXPECT_EQ(db->layerNames().size(), c.layers);
        EXPECT_FALSE(db->isModified());
        EXPECT_EQ(Written(*db), ReadFile(Fixture(c.file)));
    }
}

TEST(Drawing, HeaderSettingsOfAnOlderFile)
{
    auto db = Open(Fixture("r2000.dxf"));
    EXPECT_EQ(db->aunits(), 1);
    EXPECT_EQ(db->angbase(), 90.0);
    EXPECT_TRUE(db->angdir());
    EXPECT_EQ(db->cecolor().colorIndex(), 3);
    EXPECT_FALSE(db->limcheck());
}

TEST(Drawing, OmittedHeaderVariablesTakeDefaultsAndAreAddedOnceSet)
{
    auto db = Open(Fixture("r2018.dxf"));
    EXPECT_EQ(db->osmode(), VelHeaderSettings{}.osmode);
    EXPECT_EQ(db->attdia(), VelHeaderSettings{}.attdia);
    EXPECT_EQ(db->attreq(), VelHeaderSettings{}.attreq);
    EXPECT_TRUE(db->limcheck());
    EXPECT_TRUE(db->orthomode());
    ASSERT_EQ(db->setOsmode(512), Acad::eOk);
    ASSERT_EQ(db->setLimcheck(false), Acad::eOk);
    EXPECT_TRUE(db->isModified());
    std::unique_ptr<AcDbDatabase> back;
    ASSERT_EQ(velReadDrawing(Written(*db), "copie.dxf", back).description(), "");
    EXPECT_EQ(back->osmode(), 512);
    EXPECT_FALSE(back->limcheck());
    EXPECT_TRUE(back->orthomode());
}

TEST(Drawing, NewObjectsGetHandlesBelowTheSeedAndTheirApplicationIsRegistered)
{
    for (const char* file : {"r2000.dxf", "r2018.dxf", "crlf.dxf"}) {
        SCOPED_TRACE(file);
        auto db = Open(Fixture(file));
        AcDbDictionary* nod = nullptr;
        ASSERT_EQ(db->getNamedObjectsDictionary(nod, AcDb::kForWrite), Acad::eOk);
        auto* record = new AcDbXrecord;
        AcDbObjectId id;
        ASSERT_EQ(nod->setAt("NOUVEAU", record, id), Acad::eOk);
        VelRbBuilder list;
        list.add(velRbString(1001, "NOUVELLE_APP")).add(velRbShort(1070, 3));
        ASSERT_EQ(record->setXData(list.head()), Acad::eOk);
        record->close();
        nod->close();
        EXPECT_TRUE(db->isRegApp("NOUVELLE_APP"));
        const std::string text = Written(*db);
        if (std::string(file) == "crlf.dxf") {
            EXPECT_EQ(text.find("NOUVELLE_APP\n"), std::string::npos);
            EXPECT_NE(text.find("NOUVELLE_APP\r\n"), std::string::npos);
        }
        std::unique_ptr<AcDbDatabase> back;
        ASSERT_EQ(velReadDrawing(text, file, back).description(), "");
        EXPECT_TRUE(back->isRegApp("NOUVELLE_APP"));
        const vel::dxf::Sections& records = back->file().records();
        std::uint64_t highest = 0;
        for (std::size_t i = 0; i < records.size(); ++i)
            highest = std::max(highest, records[i].handle);
        const auto seed = text.find("$HANDSEED");
        ASSERT_NE(seed, std::string::npos);
        std::istringstream header(text.substr(seed + 9));
        std::string code, value;
        header >> code >> value;
        EXPECT_GT(std::stoull(value, nullptr, 16), highest);
        AcDbDictionary* nod2 = nullptr;
        ASSERT_EQ(back->getNamedObjectsDictionary(nod2, AcDb::kForRead), Acad::eOk);
        AcDbObject* again = nullptr;
        ASSERT_EQ(nod2->getAt("nouveau", again, AcDb::kForRead), Acad::eOk);
        VelRbPtr xd(again->xData("NOUVELLE_APP"));
        ASSERT_TRUE(xd && xd->rbnext);
        EXPECT_EQ(xd->rbnext->resval.rint, 3);
        again->close();
        nod2->close();
    }
}

TEST(Drawing, TextOfOlderFilesIsWrittenInTheirCodePage)
{
    auto db = Open(Fixture("r2004_1252.dxf"));
    std::vector<std::string> names = db->layerNames();
    EXPECT_NE(std::find(names.begin(), names.end(), "Réseau_Été"), names.end());
    AcDbObjectId layer;
    ASSERT_EQ(db->addLayer("Calque Ω é", layer), Acad::eOk);
    ASSERT_EQ(db->setClayer(layer), Acad::eOk);
    const std::string text = Written(*db);
    EXPECT_NE(text.find("\n  8\nCalque \\U+03A9 \xE9\n"), std::string::npos);
    std::unique_ptr<AcDbDatabase> back;
    ASSERT_EQ(velReadDrawing(text, "copie.dxf", back).description(), "");
    EXPECT_EQ(back->layerName(back->clayer()), "Calque Ω é");
}

TEST(Drawing, R12DrawingsHoldNoDictionaries)
{
    auto db = Open(Fixture("r12.dxf"));
    AcDbDictionary* nod = nullptr;
    EXPECT_EQ(db->getNamedObjectsDictionary(nod, AcDb::kForRead), Acad::eNotApplicable);
    AcDbObjectId layer;
    ASSERT_EQ(db->addLayer("NOUVEAU", layer), Acad::eOk);
    ASSERT_EQ(db->addRegApp("APP_R12"), Acad::eOk);
    std::unique_ptr<AcDbDatabase> back;
    ASSERT_EQ(velReadDrawing(Written(*db), "r12.dxf", back).description(), "");
    EXPECT_EQ(back->getLayerId("nouveau", layer), Acad::eOk);
    EXPECT_TRUE(back->isRegApp("APP_R12"));
}

// A small sound drawing; the malformed cases below each spoil one thing in it.
std::string Sound()
{
    return "  0\nSECTION\n  2\nHEADER\n  9\n$ACADVER\n  1\nAC1032\n  9\n$HANDSEED\n  5\nFF\n  0\nENDSEC\n"
           "  0\nSECTION\n  2\nTABLES\n  0\nTABLE\n  2\nLAYER\n  5\n2\n 70\n1\n"
           "  0\nLAYER\n  5\n10\n330\n2\n  2\n0\n 70\n0\n 62\n7\n  0\nENDTAB\n  0\nENDSEC\n"
           "  0\nSECTION\n  2\nENTITIES\n"
           "  0\nLINE\n  5\n20\n  8\n0\n 10\n0.0\n1001\nACAD\n1000\ntexte\n"
           "  0\nENDSEC\n"
           "  0\nSECTION\n  2\nOBJECTS\n"
           "  0\nDICTIONARY\n  5\nC\n330\n0\n100\nAcDbDictionary\n  3\nA\n350\nD\n"
           "  0\nDICTIONARY\n  5\nD\n330\nC\n100\nAcDbDictionary\n  3\nB\n360\nE\n"
           "  0\nDICTIONARY\n  5\nE\n330\nD\n100\nAcDbDictionary\n"
           "  0\nENDSEC\n  0\nEOF\n";
}

std::string Replace(std::string text, std::string_view what, std::string_view with)
{
    const auto at = text.find(what);
    EXPECT_NE(at, std::string::npos) << what;
    if (at != std::string::npos)
        text.replace(at, what.size(), with);
    return text;
}

std::uint32_t LineOf(const std::string& text, std::string_view marker)
{
    const auto at = text.find(marker);
    return 1 +
           static_cast<std::uint32_t>(std::count(text.begin(), text.begin() + static_cast<std::ptrdiff_t>(at), '\n'));
}

TEST(Drawing, MalformedFilesAreRefusedWithFileLineAndExpectation)
{
    const std::string sound = Sound();
    {
        std::unique_ptr<AcDbDatabase> db;
        ASSERT_EQ(velReadDrawing(sound, "bon.dxf", db).description(), "");
    }
    struct Case {
        const char* name;
        std::string text;
        std::string marker; // the line the message names starts with this (after the replacement)
        std::string expected;
    };
    const std::string truncated = sound.substr(0, sound.find("  0\nENDSEC\n  0\nEOF"));
    const Case cases[] = {
        {"truncated before the end", truncated, "", "0 EOF en fin de fichier (fichier tronqué ?)"},
        {"odd pair", truncated + "  0\n", "", "une valeur après le code de groupe (fichier tronqué)"},
        {"non-numeric group code", Replace(sound, "  8\n0\n 10", "  8\n0\n1O"), "1O",
         "un code de groupe (nombre entier)"},
        {"dangling dictionary entry", Replace(sound, "350\nD\n", "350\n99\n"), "350\n99",
         "une entrée vers un objet du dessin (l'identifiant 99 de « A » n'existe pas)"},
        {"entry to a handle only given in memory",
         Replace(
             Replace(Replace(Replace(sound, "$HANDSEED\n  5\nFF", "$HANDSEED\n  5\nE"), "  5\nE\n330\nD\n", "330\nD\n"),
                     "  5\n10\n330\n2\n", "  5\n4\n330\n2\n"),
             "  5\n20\n", "  5\n5\n"),
         "360\nE", "une entrée vers un objet du dessin (l'identifiant E de « B » n'existe pas)"},
        {"cyclic dictionaries",
         Replace(sound, "100\nAcDbDictionary\n  0\nENDSEC", "100\nAcDbDictionary\n  3\nX\n350\nC\n  0\nENDSEC"),
         "350\nC\n  0\nENDSEC",
         "une entrée qui ne remonte pas à un dictionnaire parent (« X » ramène au dictionnaire de la ligne 65)"},
        {"duplicate handle", Replace(sound, "  5\n20\n", "  5\n10\n"), "  0\nLINE",
         "un identifiant unique (10 est déjà celui de la ligne 27)"},
        {"invalid UTF-8 text", Replace(sound, "texte", "t\xE9xte"), "t\xE9xte", "un texte UTF-8 valide"},
        {"malformed XData", Replace(sound, "1000\ntexte\n", "1070\ntexte\n"), "1070", "un entier de 16 bits"},
        {"entity outside a section", Replace(sound, "  0\nSECTION\n  2\nENTITIES\n", ""), "  0\nLINE", "0 SECTION"},
        {"section without name", Replace(sound, "  2\nENTITIES\n", ""), "  0\nLINE", "le nom de la section (code 2)"},
        {"missing ENDSEC", Replace(sound, "  0\nENDSEC\n  0\nSECTION\n  2\nOBJECTS", "  0\nSECTION\n  2\nOBJECTS"),
         "  0\nSECTION\n  2\nOBJECTS", "0 ENDSEC avant la section suivante"},
        {"header value that is no number", Replace(sound, "$HANDSEED\n  5\nFF", "$OSMODE\n 70\nbeaucoup"), "beaucoup",
         "un entier pour $OSMODE"},
        {"entry without table", Replace(sound, "  0\nTABLE\n  2\nLAYER\n  5\n2\n 70\n1\n", ""), "  0\nLAYER",
         "0 TABLE avant l'entrée de table"},
        {"cut binary signature", "AutoCAD Binary DXF\r\n\x1a", "", "la signature complète du DXF binaire"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.name);
        std::unique_ptr<AcDbDatabase> db;
        const VelReadResult read = velReadDrawing(c.text, "plan.dxf", db);
        EXPECT_EQ(read.status, VelReadStatus::kMalformed);
        EXPECT_FALSE(db);
        std::uint32_t line = c.marker.empty() ? 0 : LineOf(c.text, c.marker);
        if (c.marker.empty())
            line = static_cast<std::uint32_t>(std::count(c.text.begin(), c.text.end(), '\n')) + 1;
        if (std::string(c.name) == "cut binary signature")
            line = 1;
        EXPECT_EQ(read.line, static_cast<std::int64_t>(line));
        EXPECT_EQ(read.expected, c.expected);
        EXPECT_EQ(read.description(), "« plan.dxf », ligne " + std::to_string(line) + " : il fallait " + c.expected);
    }
}

TEST(Drawing, ASeedLeftTooLowIsRaisedOnlyWhenSomethingIsWritten)
{
    const std::string text = Replace(Sound(), "$HANDSEED\n  5\nFF", "$HANDSEED\n  5\n2");
    std::unique_ptr<AcDbDatabase> db;
    ASSERT_EQ(velReadDrawing(text, "graine.dxf", db).description(), "");
    EXPECT_EQ(Written(*db), text);
    AcDbDictionary* nod = nullptr;
    ASSERT_EQ(db->getNamedObjectsDictionary(nod, AcDb::kForWrite), Acad::eOk);
    auto* record = new AcDbXrecord;
    AcDbObjectId id;
    ASSERT_EQ(nod->setAt("NOUVEAU", record, id), Acad::eOk);
    record->close();
    nod->close();
    EXPECT_EQ(id.handle(), 0x21u); // above the highest handle, 20
    const std::string written = Written(*db);
    EXPECT_NE(written.find("$HANDSEED\n  5\n22\n"), std::string::npos);
}

TEST(Drawing, DictionaryEntriesMayNameDictionariesOfAnySection)
{
    // A cycle through a dictionary filed among the entities is still a cycle.
    const std::string text = Replace(Sound(), "  0\nLINE\n  5\n20\n  8\n0\n 10\n0.0\n1001\nACAD\n1000\ntexte\n",
                                     "  0\nDICTIONARY\n  5\n20\n  3\nY\n350\nC\n");
    const std::string looped = Replace(text, "  3\nA\n350\nD\n", "  3\nA\n350\nD\n  3\nZ\n350\n20\n");
    std::unique_ptr<AcDbDatabase> db;
    const VelReadResult read = velReadDrawing(looped, "boucle.dxf", db);
    EXPECT_EQ(read.line, 75);
    EXPECT_EQ(read.expected, "une entrée qui ne remonte pas à un dictionnaire parent "
                             "(« Z » ramène au dictionnaire de la ligne 47)");
}

TEST(Drawing, DuplicateHandlesFoundHoweverShuffled)
{
    for (int count : {3, 70}) { // few ascending runs are merged, many are sorted
        SCOPED_TRACE(count);
        std::string lines;
        for (int k = count; k > 0; --k)
            lines += "  0\nLINE\n  5\n" + FormatHandle(0x100 + static_cast<unsigned>(k)) + "\n  8\n0\n";
        const std::string sound = Replace(Sound(), "  0\nENDSEC\n  0\nSECTION\n  2\nOBJECTS",
                                          lines + "  0\nENDSEC\n  0\nSECTION\n  2\nOBJECTS");
        std::unique_ptr<AcDbDatabase> db;
        ASSERT_EQ(velReadDrawing(sound, "lignes.dxf", db).description(), "");
        EXPECT_FALSE(db->idFromHandle(0x101).isNull());
        const std::string twice = Replace(sound, "  5\n102\n", "  5\n" + FormatHandle(0x100 + count) + "\n");
        const VelReadResult read = velReadDrawing(twice, "lignes.dxf", db);
        EXPECT_EQ(read.status, VelReadStatus::kMalformed);
        EXPECT_EQ(read.expected.rfind("un identifiant unique (" + FormatHandle(0x100 + count) + " ", 0), 0u)
            << read.description();
    }
}

TEST(Drawing, HandlesUseAll64Bits)
{
    const std::string text = Replace(Sound(), "  0\nLINE\n  5\n20\n", "  0\nLINE\n  5\nfffffffffffffffe\n");
    std::unique_ptr<AcDbDatabase> db;
    ASSERT_EQ(velReadDrawing(text, "grand.dxf", db).description(), "");
    AcDbObject* line = nullptr;
    ASSERT_EQ(db->openObject(line, db->idFromHandle(0xFFFFFFFFFFFFFFFEULL), AcDb::kForRead), Acad::eOk);
    EXPECT_EQ(line->dxfName(), "LINE");
    line->close();
    AcDbDictionary* nod = nullptr;
    ASSERT_EQ(db->getNamedObjectsDictionary(nod, AcDb::kForWrite), Acad::eOk);
    AcDbObjectId id;
    auto* last = new AcDbXrecord;
    ASSERT_EQ(nod->setAt("DERNIER", last, id), Acad::eOk);
    EXPECT_EQ(id.handle(), 0xFFFFFFFFFFFFFFFFULL);
    auto* tooMany = new AcDbXrecord;
    EXPECT_EQ(nod->setAt("DE TROP", tooMany, id), Acad::eNotApplicable);
    delete tooMany;
    last->close();
    nod->close();
}

TEST(Drawing, BinaryDrawingsAreWrittenBackInBinary)
{
    for (const char* file : {"r2018_bin.dxf", "r12_bin.dxf"}) {
        SCOPED_TRACE(file);
        auto db = Open(Fixture(file));
        AcDbObjectId layer;
        ASSERT_EQ(db->addLayer("BINAIRE", layer), Acad::eOk);
        ASSERT_EQ(db->setClayer(layer), Acad::eOk);
        const std::string bytes = Written(*db);
        EXPECT_EQ(bytes.substr(0, 22), std::string_view("AutoCAD Binary DXF\r\n\x1a\0", 22));
        std::unique_ptr<AcDbDatabase> back;
        ASSERT_EQ(velReadDrawing(bytes, file, back).description(), "");
        EXPECT_EQ(back->layerName(back->clayer()), "BINAIRE");
        EXPECT_EQ(back->dxfVersion(), db->dxfVersion());
    }
}

TEST(Drawing, MalformedBinaryDrawingsNameTheGroup)
{
    const std::string good = ReadFile(Fixture("r2018_bin.dxf"));
    std::string spoiled = good;
    spoiled.replace(24, 7, "SECTIOX");
    // Values the text form could not give back bit for bit are refused.
    std::string nan("AutoCAD Binary DXF\r\n\x1a\0\0\0SECTION\0\x02\0HEADER\0\x09\0$ANGBASE\0\x32\0", 54);
    nan.append("\0\0\0\0\0\0\xF8\x7F", 8);
    const std::string negative("AutoCAD Binary DXF\r\n\x1a\0\0\0SECTION\0\xFE\xFFx\0", 36);
    struct Case {
        std::string bytes;
        int group;
        const char* expected;
    };
    const Case cases[] = {
        {good.substr(0, 40), 2, "un texte terminé par un octet nul (fichier tronqué)"},
        {spoiled, 1, "0 SECTION"},
        {nan, 4, "un nombre réel fini"},
        {negative, 2, "un code de groupe de 0 à 32767"},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.expected);
        std::unique_ptr<AcDbDatabase> db;
        const VelReadResult read = velReadDrawing(c.bytes, "b.dxf", db);
        EXPECT_EQ(read.status, VelReadStatus::kMalformed);
        EXPECT_EQ(read.line, c.group);
        EXPECT_EQ(read.description(),
                  "« b.dxf » (DXF binaire), groupe " + std::to_string(c.group) + " : il fallait " + c.expected);
    }
}

TEST(Drawing, OpenAndSaveReportFileErrors)
{
    std::unique_ptr<AcDbDatabase> db;
    const VelReadResult missing = velOpenDrawing("/nonexistent/plan.dxf", db);
    EXPECT_EQ(missing.status, VelReadStatus::kNotFound);
    EXPECT_EQ(missing.description(), "« /nonexistent/plan.dxf » : impossible d'ouvrir le fichier (" +
                                         std::string(std::strerror(ENOENT)) + ")");
    EXPECT_EQ(velOpenDrawing("/tmp", db).status, VelReadStatus::kNotAFile);
    std::string error;
    AcDbDatabase fresh;
    EXPECT_FALSE(velSaveDrawing(fresh, "/nonexistent/plan.dxf", error));
    EXPECT_EQ(error.rfind("Fichier « /nonexistent/plan.dxf » non enregistré : dossier introuvable", 0), 0u) << error;
}

TEST(Drawing, SaveThatFailsAnywhereLeavesThePreviousDrawing)
{
    TempDir dir;
    const std::string original = ReadFile(Fixture("r2018.dxf"));
    const std::string path = dir.File("plan.dxf");
    std::unique_ptr<AcDbDatabase> db;
    std::string error;
    bool saved = false;
    const int calls = ForEveryFailingCall(
        [&] {
            dir.Write("plan.dxf", original);
            db = Open(path);
            AcDbObjectId layer;
            db->addLayer("NOUVEAU", layer);
        },
        [&] { saved = velSaveDrawing(*db, path, error); },
        [&](const FaultRun& run) {
            SCOPED_TRACE(run.failed + " n° " + std::to_string(run.calls));
            auto back = Open(path);
            ASSERT_NE(back, nullptr);
            if (run.committed) {
                EXPECT_TRUE(saved);
                AcDbObjectId layer;
                EXPECT_EQ(back->getLayerId("NOUVEAU", layer), Acad::eOk);
                return;
            }
            EXPECT_FALSE(saved);
            EXPECT_EQ(ReadFile(path), original);
            EXPECT_EQ(error.rfind("Fichier « " + path +
                                      " » non enregistré : " + velFileErrorReason(FileFaults::ErrorOf(run.failed)),
                                  0),
                      0u)
                << error;
            EXPECT_NE(error.find("Le fichier précédent est conservé tel quel"), std::string::npos) << error;
            EXPECT_EQ(std::distance(std::filesystem::directory_iterator(dir.path), {}), 1) << "no temporary file";
        });
    EXPECT_GT(calls, 8);
}

TEST(Drawing, FileCutShortWhileOpenDoesNotReachTheDrawing)
{
    TempDir dir;
    const std::string original = ReadFile(Fixture("r2018.dxf"));
    const std::string path = dir.Write("plan.dxf", original);
    auto db = Open(path);
    ASSERT_NE(db, nullptr);
    // Another program empties the file while the drawing is open.
    ASSERT_EQ(truncate(path.c_str(), 0), 0);
    EXPECT_EQ(Written(*db), original);
    AcDbObjectId layer;
    ASSERT_EQ(db->addLayer("APRES", layer), Acad::eOk);
    std::string error;
    ASSERT_TRUE(velSaveDrawing(*db, path, error)) << error;
    auto back = Open(path);
    ASSERT_NE(back, nullptr);
    EXPECT_EQ(back->getLayerId("APRES", layer), Acad::eOk);
}

} // namespace

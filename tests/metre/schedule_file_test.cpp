// The schedule file: every field round-trips, malformed files are refused with their
// line and nothing delivered, and a write that fails leaves the file and its backup.
#include "schedule_file.hpp"

#include "support/temp_dir.hpp"
#include "text/text.hpp"

#include <gtest/gtest.h>
#include <pugixml.hpp>

#include <algorithm>
#include <bit>
#include <cfloat>
#include <cerrno>
#include <climits>
#include <cmath>
#include <csignal>
#include <cstring>
#include <random>
#include <sys/resource.h>

namespace {

using metre::ArticleVector;

// Every field set to something a careless writer would damage.
CZodEVIArticle Tricky(int seed)
{
    CZodEVIArticle a;
    const double reals[] = {12345.67, 1500000, DBL_MAX, -DBL_MIN, 5e-324, -0.0, 0.1, 1e-300, 19.6, 1.0 / 3, 2.5e17};
    const int ints[] = {INT_MIN, INT_MAX, -1, 0, 7, 42};
    const char* texts[] = {"Déblais « en masse » \"quotes\" & <balises>",
                           "ligne 1\r\nligne 2\nfin\r",
                           "  espaces au bord  ",
                           "Voirie\\\\Terrassements\\\\Volumique\\\\GC-001 - Volume des déblais",
                           "\ttab\t",
                           "",
                           "œuvre Œ ÿ € m² m³ 'apostrophe'"};
    int r = seed, i = seed, t = seed;
    for (const CZodEVIArticleField& field : ArticleFields()) {
        switch (field.type) {
        case CZodEVIArticleField::Type::Real:
            a.*field.real = reals[r++ % std::size(reals)];
            break;
        case CZodEVIArticleField::Type::Int:
            a.*field.integer = ints[i++ % std::size(ints)];
            break;
        case CZodEVIArticleField::Type::Text:
            a.*field.text = texts[t++ % std::size(texts)];
            break;
        }
    }
    return a;
}

void ExpectSameFields(const CZodEVIArticle& expected, const CZodEVIArticle& actual)
{
    for (const CZodEVIArticleField& field : ArticleFields()) {
        SCOPED_TRACE(field.name);
        switch (field.type) {
        case CZodEVIArticleField::Type::Real:
            EXPECT_EQ(std::memcmp(&(expected.*field.real), &(actual.*field.real), sizeof(double)), 0)
                << expected.*field.real << " became " << actual.*field.real;
            break;
        case CZodEVIArticleField::Type::Int:
            EXPECT_EQ(expected.*field.integer, actual.*field.integer);
            break;
        case CZodEVIArticleField::Type::Text:
            EXPECT_EQ(expected.*field.text, actual.*field.text);
            break;
        }
    }
}

std::vector<const CZodEVIArticle*> Pointers(const std::vector<CZodEVIArticle>& articles)
{
    std::vector<const CZodEVIArticle*> out;
    for (const CZodEVIArticle& a : articles)
        out.push_back(&a);
    return out;
}

TEST(ScheduleFile, EveryFieldRoundTrips)
{
    TempDir dir;
    std::vector<CZodEVIArticle> articles;
    for (int seed = 0; seed < 7; ++seed)
        articles.push_back(Tricky(seed));
    articles.push_back(CZodEVIArticle());
    const std::string path = dir.File("VelaBordereau.xml");
    ASSERT_TRUE(metre::WriteScheduleFile(path, Pointers(articles)));
    ArticleVector read;
    const VelReadResult result = metre::ReadScheduleFile(path, read);
    ASSERT_TRUE(result) << result.message;
    ASSERT_EQ(read.size(), articles.size());
    for (std::size_t i = 0; i < articles.size(); ++i) {
        SCOPED_TRACE(i);
        ExpectSameFields(articles[i], *read[i]);
    }
}

// The file as the document writer made it before the text was written directly: the
// written text must stay this, byte for byte.
std::string DocumentText(const std::vector<const CZodEVIArticle*>& articles)
{
    pugi::xml_document document;
    pugi::xml_node declaration = document.append_child(pugi::node_declaration);
    declaration.append_attribute("version").set_value("1.0");
    declaration.append_attribute("encoding").set_value("UTF-8");
    pugi::xml_node root = document.append_child(metre::kScheduleRoot);
    for (const CZodEVIArticle* article : articles) {
        if (article == nullptr)
            continue;
        pugi::xml_node node = root.append_child(metre::kScheduleArticle);
        for (const CZodEVIArticleField& field : ArticleFields())
            node.append_attribute(field.name).set_value(metre::FieldText(*article, field).c_str());
    }
    std::ostringstream out;
    document.save(out, "  ", pugi::format_indent, pugi::encoding_utf8);
    return out.str();
}

// Articles whose texts take any byte (NUL and control characters included) and whose
// numbers take any bit pattern, between plainer prices and counts.
std::vector<CZodEVIArticle> Varied(std::size_t count)
{
    std::mt19937_64 random(count);
    std::vector<CZodEVIArticle> articles(count);
    for (CZodEVIArticle& a : articles) {
        for (const CZodEVIArticleField& field : ArticleFields()) {
            const unsigned kind = random() % 4;
            // Round numbers of every magnitude and their neighbours: where "%g", fixed and
            // exponent forms part.
            const double round =
                static_cast<double>(random() % 9 + 1) * std::pow(10.0, static_cast<int>(random() % 30) - 10);
            switch (field.type) {
            case CZodEVIArticleField::Type::Real:
                a.*field.real =
                    kind == 0   ? std::bit_cast<double>(random())
                    : kind == 1 ? static_cast<double>(random() % 100000) / 100
                    : kind == 2
                        ? (random() % 3 == 0 ? round : std::nextafter(round, random() % 2 ? 0.0 : HUGE_VAL))
                        : std::ldexp(static_cast<double>(random() % 1000), static_cast<int>(random() % 140) - 70);
                break;
            case CZodEVIArticleField::Type::Int:
                a.*field.integer = kind == 0 ? static_cast<int>(random()) : static_cast<int>(random() % 100);
                break;
            case CZodEVIArticleField::Type::Text:
                if (kind != 0) {
                    a.*field.text = "Réseau « EU » 'n°" + std::to_string(random() % 1000) + "' & <fin>";
                    break;
                }
                for (std::size_t n = random() % 40; n > 0; --n)
                    (a.*field.text) += static_cast<char>(random() % 256);
                break;
            }
        }
    }
    return articles;
}

TEST(ScheduleFile, WrittenTextIsTheDocumentsByteForByte)
{
    std::vector<CZodEVIArticle> tricky;
    for (int seed = 0; seed < 7; ++seed)
        tricky.push_back(Tricky(seed));
    ArticleVector example;
    const std::string examplePath = std::string(VEL_TEST_DATA) + "/../../examples/VelaBordereau.xml";
    ASSERT_TRUE(metre::ReadScheduleFile(examplePath, example));
    std::vector<CZodEVIArticle> exampleCopy;
    for (const auto& a : example)
        exampleCopy.push_back(*a);
    struct Case {
        const char* name;
        std::vector<CZodEVIArticle> articles;
    };
    const Case cases[] = {
        {"none", {}},
        {"defaults", {CZodEVIArticle()}},
        {"tricky", tricky},
        {"example", exampleCopy},
        {"1k varied", Varied(1000)},
        {"10k varied", Varied(10000)},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        std::vector<const CZodEVIArticle*> pointers = Pointers(c.articles);
        pointers.insert(pointers.begin() + static_cast<long>(pointers.size() / 2), nullptr);
        const std::string written = metre::ScheduleToXml(pointers);
        EXPECT_TRUE(written == DocumentText(pointers)); // megabytes: no diff printed
    }
    std::ifstream in(examplePath, std::ios::binary);
    const std::string exampleFile{std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>()};
    EXPECT_EQ(metre::ScheduleToXml(Pointers(exampleCopy)), exampleFile);
}

// The direct reading of the file's numbers agrees with SetFieldText on every form: the
// same value to the bit, or the same refusal.
TEST(ScheduleFile, NumbersReadAsSetFieldTextReadsThem)
{
    // Counts, reals, then forms a hand-made reader would take or refuse unlike SetFieldText.
    const std::vector<const char*> groups[] = {
        {"0", "-0", "007", "42", "-17", "123456789", "1234567890", "-2147483648", "2147483647", "2147483648",
         "999999999999999", "9999999999999999", "12345678901234567890"},
        {"1.5", "-0.0", "0.1", "-12.50", "123456.789012345", "0.000000000000001", "1234567.890123456",
         "1.0000000000000002", "1e5", "1E-400", "1e400"},
        {" 12", "12 ", "\t3\n", "+3", "+-3", "-", "", ".5", "5.", "0x10", "nan", "-inf", "12,5", "1_000"}};
    const auto& fields = ArticleFields();
    const auto real =
        std::find_if(fields.begin(), fields.end(), [](const auto& f) { return f.name == std::string("unitPrice"); });
    const auto integer =
        std::find_if(fields.begin(), fields.end(), [](const auto& f) { return f.name == std::string("number"); });
    for (const std::vector<const char*>& values : groups) {
        for (const char* value : values) {
            for (const CZodEVIArticleField* field : {&*real, &*integer}) {
                SCOPED_TRACE(std::string(field->name) + "=\"" + value + "\"");
                CZodEVIArticle expected;
                const bool accepted = metre::SetFieldText(expected, *field, value);
                ArticleVector read;
                const VelReadResult result = metre::ReadScheduleText(
                    FormatString("<bordereau><article %s=\"%s\"/></bordereau>", field->name, value), "b.xml", read);
                ASSERT_EQ(static_cast<bool>(result), accepted) << result.message;
                if (accepted)
                    ExpectSameFields(expected, *read.at(0));
            }
        }
    }
}

TEST(ScheduleFile, RealsAreWrittenShortAndWithoutLocale)
{
    CZodEVIArticle a;
    a.unitPrice = 12345.67;
    a.metreReal1 = 1500000;
    a.taxRate = 5.5;
    std::setlocale(LC_NUMERIC, "fr_FR.UTF-8");
    const std::string xml = metre::ScheduleToXml({&a});
    std::setlocale(LC_NUMERIC, "C");
    EXPECT_NE(xml.find("unitPrice=\"12345.67\""), std::string::npos) << xml;
    EXPECT_NE(xml.find("metreReal1=\"1500000\""), std::string::npos);
    EXPECT_NE(xml.find("taxRate=\"5.5\""), std::string::npos);
    EXPECT_NE(xml.find("encoding=\"UTF-8\""), std::string::npos);
}

TEST(ScheduleFile, MalformedFilesAreRefusedWithTheirLine)
{
    struct Case {
        const char* name;
        const char* content; // null: no file
        const char* expected;
    } cases[] = {
        {"missing", nullptr, "fichier introuvable"},
        {"not xml", "<?xml version=\"1.0\"?>\n<bordereau>\n<article code=\"A\">\n</bordereau>\n", "ligne 4"},
        {"text", "ceci n'est pas du XML\n", "aucun élément XML"},
        {"other root", "<?xml version=\"1.0\"?>\n\n<devis/>\n",
         "ligne 3 : élément racine <bordereau> attendu, <devis>"},
        {"bad real", "<bordereau>\n<article code=\"A\"/>\n<article unitPrice=\"12,5\"/>\n</bordereau>",
         "ligne 3 : article 2, champ « unitPrice » : nombre attendu, « 12,5 » trouvé"},
        {"bad int", "<bordereau>\n<article number=\"3000000000\"/>\n</bordereau>",
         "ligne 2 : article 1, champ « number » : nombre entier attendu"},
        {"unknown field", "<bordereau>\n<article prix=\"1\"/>\n</bordereau>",
         "ligne 2 : article 1, champ inconnu « prix »"},
        {"twice", "<bordereau>\n<article code=\"A\" code=\"B\"/>\n</bordereau>", "champ « code » en double"},
        {"stray element", "<bordereau>\n<article/>\n<ligne/>\n</bordereau>",
         "ligne 3 : élément <article> attendu, <ligne>"},
        {"article after the root", "<bordereau>\n<article/>\n</bordereau>\n<article code=\"B\"/>\n",
         "ligne 4 : élément <article> après la fin de <bordereau> ; un bordereau n'a qu'un élément racine"},
        {"truncated", "<bordereau>\n<article code=\"A\"/>\n<article code=\"B\"", "ligne 3"},
        // Reading rewrites escapes and name ends in place; lines are those of the file.
        {"lines after escapes",
         "<bordereau>\n<article\ncode=\"a&#10;b&#10;c&#10;\"\n/>\n<article prix=\"1\"/>\n</bordereau>",
         "ligne 5 : article 2, champ inconnu « prix »"},
    };
    TempDir dir;
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        const std::string path =
            c.content ? dir.Write(std::string(c.name) + ".xml", c.content) : dir.File("absent.xml");
        ArticleVector out;
        out.push_back(std::make_unique<CZodEVIArticle>());
        const VelReadResult result = metre::ReadScheduleFile(path, out);
        EXPECT_EQ(result.status, c.content ? VelReadStatus::kMalformed : VelReadStatus::kNotFound);
        EXPECT_EQ(result.file, path);
        if (c.content) {
            // The line the message names is the one the caller is given.
            EXPECT_NE(result.message.find(", ligne " + std::to_string(result.line) + " : "), std::string::npos)
                << result.message;
            EXPECT_FALSE(result.expected.empty());
        }
        EXPECT_NE(result.message.find(path), std::string::npos) << result.message;
        EXPECT_NE(result.message.find(c.expected), std::string::npos) << result.message;
        EXPECT_EQ(out.size(), 1u) << "a refused file delivers nothing";
        if (c.content) {
            EXPECT_EQ(dir.Read(std::string(c.name) + ".xml"), c.content);
        }
    }
}

std::string Replaced(std::string text, std::string_view from, std::string_view to)
{
    const std::size_t at = text.find(from);
    EXPECT_NE(at, std::string::npos) << from;
    return at == std::string::npos ? text : text.replace(at, from.size(), to);
}

// A file as the module writes it is read straight from its text; any other form (a file
// edited by hand, a fault) is left to the document reading, which gives the articles or
// the message. Both readings agree wherever the direct one reads.
TEST(ScheduleFile, DirectReadingAgreesWithTheDocumentOrStandsAside)
{
    const CZodEVIArticle first = Tricky(0), second = Tricky(3);
    const std::string written = metre::ScheduleToXml({&first, &second});
    const std::string declaration = "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n";
    const auto one = [&](const std::string& article) {
        return declaration + "<bordereau>\n  " + article + "\n</bordereau>\n";
    };
    std::string crlf;
    for (const char c : written)
        crlf += c == '\n' ? std::string("\r\n") : std::string(1, c);
    struct Case {
        const char* name;
        std::string text;
        bool direct; // read straight from the text
        bool reads;
    } cases[] = {
        {"as written", written, true, true},
        {"empty, as written", metre::ScheduleToXml({}), true, true},
        {"empty root closed apart", declaration + "<bordereau>\n</bordereau>", true, true},
        {"CRLF line ends", crlf, true, true},
        {"fields in another order, tabs", one("<article\tunit=\"m²\"\tcode=\"A\" nature=\"3\"\n/>"), true, true},
        {"raw > and ' in values", one("<article code=\"a>b\" unit=\"'m'\" />"), true, true},
        {"numbers in other forms", one("<article unitPrice=\"1e5\" number=\"-0\" taxRate=\"-0\" />"), true, true},
        {"no attribute", one("<article />"), true, true},
        {"comment", Replaced(written, "<bordereau>\n", "<bordereau>\n<!-- prix négociés -->\n"), false, true},
        {"single quotes", one("<article code='A' />"), false, true},
        {"spaces around =", one("<article code = \"A\" />"), false, true},
        {"unknown escape", one("<article code=\"D&eacute;blais\" />"), false, true},
        {"hexadecimal reference", one("<article code=\"&#xE9;\" />"), false, true},
        {"reference beyond ASCII", one("<article code=\"&#233;&#8364;\" />"), false, true},
        {"reference to NUL", one("<article code=\"a&#0;b\" />"), false, true},
        {"reference with four digits", one("<article code=\"&#0065;\" />"), false, true},
        {"entity of a doctype",
         Replaced(written, "<bordereau>", "<!DOCTYPE bordereau [<!ENTITY p \"12\">]>\n<bordereau>"), false, true},
        {"BOM", "\xEF\xBB\xBF" + written, false, true},
        {"no declaration", written.substr(declaration.size()), false, true},
        {"other declaration", Replaced(written, "encoding=\"UTF-8\"", "encoding='UTF-8' standalone=\"yes\""), false,
         true},
        {"element without space", one("<article/>"), false, true},
        {"element closed apart", one("<article code=\"A\"></article>"), false, true},
        {"end tag with space", Replaced(written, "</bordereau>", "</bordereau >"), false, true},
        {"CDATA in an article", one("<article code=\"A\"><![CDATA[x]]></article>"), false, true},
        {"duplicate attribute", one("<article code=\"A\" code=\"B\" />"), false, false},
        {"unknown field", one("<article prix=\"1\" />"), false, false},
        {"bad number", one("<article unitPrice=\"12,5\" />"), false, false},
        {"int too large", one("<article number=\"3000000000\" />"), false, false},
        {"attributes glued", one("<article code=\"A\"unit=\"m\" />"), false, false},
        {"NUL in a value", one(std::string("<article code=\"a") + '\0' + "b\" />"), false, false},
        {"other root", Replaced(written, "bordereau>", "devis>"), false, false},
        {"text between articles", Replaced(written, "  <article", "prix <article"), false, false},
        {"element in an article", one("<article code=\"A\"><prix/></article>"), false, false},
        {"text after the root", written + "fin\n", false, true},
        {"second root", written + "<bordereau />\n", false, false},
        {"truncated", written.substr(0, written.size() / 2), false, false},
    };
    TempDir dir;
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        ArticleVector direct, document, read, fromFile;
        direct.push_back(std::make_unique<CZodEVIArticle>());
        EXPECT_EQ(metre::ReadScheduleDirectly(c.text, direct), c.direct);
        const VelReadResult byDocument = metre::ReadScheduleDocument(c.text, "b.xml", document);
        EXPECT_EQ(static_cast<bool>(byDocument), c.reads) << byDocument.message;
        if (!c.direct) {
            EXPECT_EQ(direct.size(), 1u) << "a text left to the document reading is not read in part";
        }
        direct.erase(direct.begin());
        const VelReadResult result = metre::ReadScheduleText(c.text, "b.xml", read);
        EXPECT_EQ(result.status, byDocument.status);
        EXPECT_EQ(result.line, byDocument.line);
        EXPECT_EQ(result.message, byDocument.message);
        // The file goes through the reading in place, which messages count lines apart from.
        const std::string path = dir.Write("b.xml", c.text);
        const VelReadResult fileResult = metre::ReadScheduleFile(path, fromFile);
        EXPECT_EQ(fileResult.status, byDocument.status);
        EXPECT_EQ(fileResult.line, byDocument.line);
        EXPECT_EQ(fileResult ? fileResult.message : Replaced(fileResult.message, path, "b.xml"), byDocument.message);
        for (const ArticleVector* other : {&direct, &read, &fromFile}) {
            if (other == &direct && !c.direct)
                continue;
            ASSERT_EQ(other->size(), document.size());
            for (std::size_t i = 0; i < document.size(); ++i)
                ExpectSameFields(*document[i], *(*other)[i]);
        }
    }
}

TEST(ScheduleFile, WriteKeepsThePreviousVersionAsBackup)
{
    TempDir dir;
    const std::string path = dir.File("b.xml");
    CZodEVIArticle first, second;
    first.code = "V1";
    second.code = "V2";
    ASSERT_TRUE(metre::WriteScheduleFile(path, {&first}));
    EXPECT_FALSE(std::filesystem::exists(path + ".bak")) << "nothing to back up the first time";
    ASSERT_TRUE(metre::WriteScheduleFile(path, {&second}));
    ArticleVector now, backup;
    ASSERT_TRUE(metre::ReadScheduleFile(path, now));
    ASSERT_TRUE(metre::ReadScheduleFile(path + ".bak", backup));
    EXPECT_EQ(now.at(0)->code, "V2");
    EXPECT_EQ(backup.at(0)->code, "V1");
}

TEST(ScheduleFile, WriteThatFailsMidwayLeavesFileAndBackup)
{
    TempDir dir;
    const std::string path = dir.File("b.xml");
    CZodEVIArticle one;
    one.code = "V1";
    ASSERT_TRUE(metre::WriteScheduleFile(path, {&one}));
    one.code = "V2";
    ASSERT_TRUE(metre::WriteScheduleFile(path, {&one}));
    const std::string file = dir.Read("b.xml"), backup = dir.Read("b.xml.bak");

    std::vector<CZodEVIArticle> many(2000, Tricky(1));
    // The file size limit makes the write fail after its first blocks, as a full disk does.
    struct rlimit saved {};
    ASSERT_EQ(getrlimit(RLIMIT_FSIZE, &saved), 0);
    const auto previousHandler = std::signal(SIGXFSZ, SIG_IGN);
    struct rlimit small = saved;
    small.rlim_cur = 64 * 1024;
    ASSERT_EQ(setrlimit(RLIMIT_FSIZE, &small), 0);
    const VelReadResult result = metre::WriteScheduleFile(path, Pointers(many));
    setrlimit(RLIMIT_FSIZE, &saved);
    std::signal(SIGXFSZ, previousHandler);

    EXPECT_EQ(result.status, VelReadStatus::kCannotWrite);
    EXPECT_EQ(result.error, EFBIG);
    EXPECT_NE(result.message.find("non enregistré : fichier trop gros pour ce disque (pendant l'écriture)"),
              std::string::npos)
        << result.message;
    EXPECT_NE(result.message.find(path), std::string::npos);
    EXPECT_EQ(dir.Read("b.xml"), file);
    EXPECT_EQ(dir.Read("b.xml.bak"), backup);
    std::size_t entries = 0;
    for ([[maybe_unused]] const auto& entry : std::filesystem::directory_iterator(dir.path))
        ++entries;
    EXPECT_EQ(entries, 3u) << "the file, its backup and its lock; no temporary file is left behind";
}

TEST(ScheduleFile, WriteIntoMissingFolderFailsCleanly)
{
    TempDir dir;
    CZodEVIArticle a;
    const VelReadResult result = metre::WriteScheduleFile(dir.File("absent/b.xml"), {&a});
    EXPECT_EQ(result.status, VelReadStatus::kCannotWrite);
    EXPECT_NE(result.message.find("absent/b.xml"), std::string::npos);
    EXPECT_FALSE(std::filesystem::exists(dir.path / "absent"));
}

} // namespace

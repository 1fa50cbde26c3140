// Fuzz target of the schedule reader: any text is refused with a message naming the file
// and delivers nothing, or is read whole; what reads is written out and reads back with
// every field the same. The direct reading of the text agrees with the document reading
// whenever it reads, and the reader answers what the document reading answers.
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>

#include "schedule_file.hpp"

namespace {

[[noreturn]] void Fault(const std::string& what)
{
    std::fprintf(stderr, "%s\n", what.c_str());
    std::abort();
}

// Every field equal, reals to the bit.
bool SameFields(const CZodEVIArticle& a, const CZodEVIArticle& b, std::string& field)
{
    for (const CZodEVIArticleField& f : ArticleFields()) {
        field = f.name;
        switch (f.type) {
        case CZodEVIArticleField::Type::Text:
            if (a.*f.text != b.*f.text)
                return false;
            break;
        case CZodEVIArticleField::Type::Real:
            if (std::memcmp(&(a.*f.real), &(b.*f.real), sizeof(double)) != 0)
                return false;
            break;
        case CZodEVIArticleField::Type::Int:
            if (a.*f.integer != b.*f.integer)
                return false;
            break;
        }
    }
    return true;
}

void ExpectSameArticles(const metre::ArticleVector& a, const metre::ArticleVector& b, const char* what)
{
    if (a.size() != b.size())
        Fault(std::string(what) + " : nombre d'articles différent");
    std::string field;
    for (std::size_t i = 0; i < a.size(); ++i)
        if (!SameFields(*a[i], *b[i], field))
            Fault(std::string(what) + " : champ différent : " + field);
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    const std::string_view text(reinterpret_cast<const char*>(data), size);
    metre::ArticleVector read;
    const VelReadResult result = metre::ReadScheduleText(text, "fuzz.xml", read);

    metre::ArticleVector direct, document;
    direct.push_back(std::make_unique<CZodEVIArticle>());
    const bool directRead = metre::ReadScheduleDirectly(text, direct);
    const VelReadResult byDocument = metre::ReadScheduleDocument(text, "fuzz.xml", document);
    if (result.status != byDocument.status || result.line != byDocument.line || result.message != byDocument.message)
        Fault("réponse différente de la lecture du document : « " + result.message + " » au lieu de « " +
              byDocument.message + " »");
    if (directRead) {
        if (!byDocument)
            Fault("lecture directe acceptée, lecture du document refusée : " + byDocument.message);
        direct.erase(direct.begin());
        ExpectSameArticles(direct, document, "lecture directe");
    } else if (direct.size() != 1) {
        Fault("lecture directe refusée mais articles livrés");
    }

    if (!result) {
        if (result.message.find("« fuzz.xml »") == std::string::npos)
            Fault("message sans nom de fichier : " + result.message);
        if (!read.empty())
            Fault("lecture refusée mais articles livrés");
        return 0;
    }
    ExpectSameArticles(read, document, "lecture");
    std::vector<const CZodEVIArticle*> articles;
    for (const auto& article : read)
        articles.push_back(article.get());
    const std::string written = metre::ScheduleToXml(articles);
    // What the module writes is read straight from its text.
    metre::ArticleVector back, backDirect;
    if (!metre::ReadScheduleDirectly(written, backDirect))
        Fault("texte écrit refusé par la lecture directe");
    const VelReadResult again = metre::ReadScheduleText(written, "fuzz2.xml", back);
    if (!again)
        Fault("relecture refusée : " + again.message);
    if (back.size() != read.size())
        Fault("nombre d'articles différent à la relecture");
    for (std::size_t i = 0; i < read.size(); ++i)
        for (const CZodEVIArticleField& field : ArticleFields())
            if (metre::FieldText(*read[i], field) != metre::FieldText(*back[i], field))
                Fault(std::string("champ changé à la relecture : ") + field.name);
    ExpectSameArticles(backDirect, back, "relecture directe");
    return 0;
}

// Fuzz target of the schedule reader: any text is refused with a message naming the file
// and delivers nothing, or is read whole; what reads is written out and reads back with
// every field the same.
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <string>

#include "schedule_file.hpp"

namespace {

[[noreturn]] void Fault(const std::string& what)
{
    std::fprintf(stderr, "%s\n", what.c_str());
    std::abort();
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    const std::string_view text(reinterpret_cast<const char*>(data), size);
    metre::ArticleVector read;
    const metre::FileResult result = metre::ReadScheduleText(text, "fuzz.xml", read);
    if (!result) {
        if (result.message.find("« fuzz.xml »") == std::string::npos)
            Fault("message sans nom de fichier : " + result.message);
        if (!read.empty())
            Fault("lecture refusée mais articles livrés");
        return 0;
    }
    std::vector<const CZodEVIArticle*> articles;
    for (const auto& article : read)
        articles.push_back(article.get());
    const std::string written = metre::ScheduleToXml(articles);
    metre::ArticleVector back;
    const metre::FileResult again = metre::ReadScheduleText(written, "fuzz2.xml", back);
    if (!again)
        Fault("relecture refusée : " + again.message);
    if (back.size() != read.size())
        Fault("nombre d'articles différent à la relecture");
    for (std::size_t i = 0; i < read.size(); ++i)
        for (const CZodEVIArticleField& field : ArticleFields())
            if (metre::FieldText(*read[i], field) != metre::FieldText(*back[i], field))
                Fault(std::string("champ changé à la relecture : ") + field.name);
    return 0;
}

// Reading and writing the price-schedule XML file: every field by name, reals in their
// shortest exact form, all-or-nothing reads and atomic writes with a backup.
#include "schedule_file.hpp"

#include "text/text.hpp"
#include "velhost/editor.h"
#include "velhost/files.h"

#include <pugixml.hpp>

#include <cerrno>
#include <climits>
#include <cstring>
#include <fcntl.h>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <sys/stat.h>
#include <unistd.h>
#include <unordered_map>

namespace metre {

namespace {

int LineOfOffset(std::string_view text, std::ptrdiff_t offset)
{
    if (offset < 0)
        return 1;
    const std::size_t end = std::min<std::size_t>(static_cast<std::size_t>(offset), text.size());
    int line = 1;
    for (std::size_t i = 0; i < end; ++i)
        if (text[i] == '\n')
            ++line;
    return line;
}

std::string ParseProblem(const pugi::xml_parse_result& result)
{
    switch (result.status) {
    case pugi::status_no_document_element:
        return "aucun élément XML";
    case pugi::status_bad_start_element:
    case pugi::status_bad_end_element:
        return "balise mal formée";
    case pugi::status_end_element_mismatch:
        return "balise de fin qui ne ferme pas l'élément ouvert";
    case pugi::status_unrecognized_tag:
        return "balise inconnue";
    case pugi::status_bad_attribute:
        return "attribut mal formé";
    case pugi::status_bad_pcdata:
    case pugi::status_bad_cdata:
    case pugi::status_bad_comment:
    case pugi::status_bad_pi:
    case pugi::status_bad_doctype:
        return "texte ou commentaire mal formé";
    case pugi::status_append_invalid_root:
        return "plusieurs éléments racine";
    default:
        return FormatString("XML illisible (%s)", result.description());
    }
}

const std::unordered_map<std::string_view, std::size_t>& FieldIndex()
{
    static const std::unordered_map<std::string_view, std::size_t> index = [] {
        std::unordered_map<std::string_view, std::size_t> map;
        const auto& fields = ArticleFields();
        for (std::size_t i = 0; i < fields.size(); ++i)
            map.emplace(fields[i].name, i);
        return map;
    }();
    return index;
}

struct StringWriter : pugi::xml_writer {
    std::string out;
    void write(const void* data, std::size_t size) override { out.append(static_cast<const char*>(data), size); }
};

std::string ErrnoText(int error)
{
    return std::strerror(error);
}

} // namespace

bool SetFieldText(CZodEVIArticle& article, const CZodEVIArticleField& field, std::string_view text)
{
    switch (field.type) {
    case CZodEVIArticleField::Type::Text:
        article.*field.text = std::string(text);
        return true;
    case CZodEVIArticleField::Type::Real: {
        const auto value = ParseReal(text);
        if (!value)
            return false;
        article.*field.real = *value;
        return true;
    }
    case CZodEVIArticleField::Type::Int: {
        const auto value = ParseInt(text);
        if (!value || *value < INT_MIN || *value > INT_MAX)
            return false;
        article.*field.integer = static_cast<int>(*value);
        return true;
    }
    }
    return false;
}

std::string FieldText(const CZodEVIArticle& article, const CZodEVIArticleField& field)
{
    switch (field.type) {
    case CZodEVIArticleField::Type::Text:
        return article.*field.text;
    case CZodEVIArticleField::Type::Real:
        return FormatRealShortest(article.*field.real);
    case CZodEVIArticleField::Type::Int:
        return FormatInt(article.*field.integer);
    }
    return {};
}


FileResult ReadScheduleText(std::string_view text, const std::string& name, ArticleVector& out)
{
    pugi::xml_document document;
    const pugi::xml_parse_result parsed =
        document.load_buffer(text.data(), text.size(), pugi::parse_minimal | pugi::parse_escapes);
    if (!parsed)
        return FileResult::Failure(FormatString("Bordereau « %s », ligne %d : %s.", name.c_str(),
                                                LineOfOffset(text, parsed.offset), ParseProblem(parsed).c_str()));
    const pugi::xml_node root = document.document_element();
    if (std::strcmp(root.name(), kScheduleRoot) != 0)
        return FileResult::Failure(FormatString("Bordereau « %s », ligne %d : élément racine <%s> attendu, <%s> trouvé ; "
                                                "ce fichier n'est pas un bordereau.",
                                                name.c_str(), LineOfOffset(text, root.offset_debug()), kScheduleRoot,
                                                root.name()));
    const auto& fields = ArticleFields();
    const auto& index = FieldIndex();
    ArticleVector read;
    for (pugi::xml_node node = root.first_child(); node; node = node.next_sibling()) {
        // Counting lines is only worth it for a message: it would make reading quadratic.
        const auto lineOf = [&] { return LineOfOffset(text, node.offset_debug()); };
        if (node.type() != pugi::node_element || std::strcmp(node.name(), kScheduleArticle) != 0)
            return FileResult::Failure(FormatString("Bordereau « %s », ligne %d : élément <%s> attendu, %s trouvé.",
                                                    name.c_str(), lineOf(), kScheduleArticle,
                                                    node.type() == pugi::node_element
                                                        ? FormatString("<%s>", node.name()).c_str()
                                                        : "du texte"));
        auto article = std::make_unique<CZodEVIArticle>();
        std::uint64_t seen = 0;
        std::size_t expected = 0;
        for (pugi::xml_attribute attribute = node.first_attribute(); attribute; attribute = attribute.next_attribute()) {
            // Files come with the fields in their order: try the next one before the map.
            std::size_t position = expected;
            if (position >= fields.size() || std::strcmp(fields[position].name, attribute.name()) != 0) {
                const auto found = index.find(attribute.name());
                if (found == index.end())
                    return FileResult::Failure(FormatString("Bordereau « %s », ligne %d : article %zu, champ inconnu « %s ».",
                                                            name.c_str(), lineOf(), read.size() + 1, attribute.name()));
                position = found->second;
            }
            if (seen & (std::uint64_t{1} << position))
                return FileResult::Failure(FormatString("Bordereau « %s », ligne %d : article %zu, champ « %s » en double.",
                                                        name.c_str(), lineOf(), read.size() + 1, attribute.name()));
            seen |= std::uint64_t{1} << position;
            if (!SetFieldText(*article, fields[position], attribute.value()))
                return FileResult::Failure(FormatString(
                    "Bordereau « %s », ligne %d : article %zu, champ « %s » : %s attendu, « %s » trouvé.", name.c_str(),
                    lineOf(), read.size() + 1, attribute.name(),
                    fields[position].type == CZodEVIArticleField::Type::Int ? "nombre entier" : "nombre",
                    attribute.value()));
            expected = position + 1;
        }
        if (node.first_child())
            return FileResult::Failure(FormatString("Bordereau « %s », ligne %d : article %zu, contenu inattendu dans <%s>.",
                                                    name.c_str(), LineOfOffset(text, node.first_child().offset_debug()),
                                                    read.size() + 1, kScheduleArticle));
        read.push_back(std::move(article));
    }
    out.insert(out.end(), std::make_move_iterator(read.begin()), std::make_move_iterator(read.end()));
    return {};
}

FileResult ReadScheduleFile(const std::string& path, ArticleVector& out)
{
    std::error_code error;
    if (!std::filesystem::exists(path, error))
        return FileResult::Failure(FormatString("Bordereau « %s » : fichier introuvable.", path.c_str()));
    if (std::filesystem::is_directory(path, error))
        return FileResult::Failure(FormatString("Bordereau « %s » : c'est un dossier, pas un fichier.", path.c_str()));
    std::ifstream in(path, std::ios::binary);
    if (!in.is_open())
        return FileResult::Failure(FormatString("Bordereau « %s » : ouverture impossible (%s).", path.c_str(),
                                                ErrnoText(errno).c_str()));
    // One read of the whole file: large schedules are read many times a session.
    std::string content(static_cast<std::size_t>(std::filesystem::file_size(path, error)), '\0');
    in.read(content.data(), static_cast<std::streamsize>(content.size()));
    if (error || in.gcount() != static_cast<std::streamsize>(content.size()))
        return FileResult::Failure(FormatString("Bordereau « %s » : lecture impossible.", path.c_str()));
    return ReadScheduleText(content, path, out);
}

std::string ScheduleToXml(const std::vector<const CZodEVIArticle*>& articles)
{
    pugi::xml_document document;
    pugi::xml_node declaration = document.append_child(pugi::node_declaration);
    declaration.append_attribute("version").set_value("1.0");
    declaration.append_attribute("encoding").set_value("UTF-8");
    pugi::xml_node root = document.append_child(kScheduleRoot);
    const auto& fields = ArticleFields();
    for (const CZodEVIArticle* article : articles) {
        if (article == nullptr)
            continue;
        pugi::xml_node node = root.append_child(kScheduleArticle);
        for (const CZodEVIArticleField& field : fields)
            node.append_attribute(field.name).set_value(FieldText(*article, field).c_str());
    }
    StringWriter writer;
    document.save(writer, "  ", pugi::format_indent, pugi::encoding_utf8);
    return std::move(writer.out);
}

FileResult WriteFileAtomically(const std::string& path, std::string_view content, bool keepBackup)
{
    VelWriteOptions options;
    options.keepBackup = keepBackup;
    VelFileResult written = velWriteFileAtomically(path, content, options);
    if (written && !written.message.empty())
        acutPrintf("%s\n", written.message.c_str());
    return {written.ok, std::move(written.message)};
}

FileResult WriteScheduleFile(const std::string& path, const std::vector<const CZodEVIArticle*>& articles)
{
    if (path.empty())
        return FileResult::Failure("Bordereau sans nom de fichier : rien n'est écrit.");
    // Another program holding the schedule's lock is checking or writing it.
    const VelFileLock lock(path);
    if (!lock.locked())
        return FileResult::Failure("Bordereau : " + lock.result().message);
    FileResult result = WriteFileAtomically(path, ScheduleToXml(articles), true);
    if (!result)
        result.message = "Bordereau : " + result.message;
    return result;
}

} // namespace metre

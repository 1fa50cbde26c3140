// The services of the metre module, on the host's current document and settings.
#include "metre_services.hpp"

#include "drawing_records.hpp"
#include "estimate.hpp"
#include "schedule_file.hpp"
#include "text/text.hpp"
#include "velhost/documents.h"
#include "velhost/editor.h"
#include "velhost/profile.h"

#include <ctime>
#include <filesystem>

namespace metre {

namespace {

constexpr const char* kSettingsSection = "Metre";

std::string& RememberedPath()
{
    static std::string path;
    return path;
}

// A name that can stand as a file name in the drawing's folder.
bool IsFileName(const std::string& name)
{
    return !name.empty() && name != "." && name != ".." && name.find_first_of("/\\:*?\"<>|\r\n") == std::string::npos;
}

// Today as "06/12/2026".
std::string Today()
{
    const std::time_t now = std::time(nullptr);
    std::tm local{};
    char text[16] = "";
    if (localtime_r(&now, &local) != nullptr)
        std::strftime(text, sizeof text, "%d/%m/%Y", &local);
    return text;
}

} // namespace

std::string SettingsFile()
{
    return (std::filesystem::path(velHostSettings().profileDir) / "VelMetre.ini").string();
}

std::string CurrencySymbol()
{
    return velGetPrivateProfileString(kSettingsSection, "Monnaie", "€", SettingsFile(), 64);
}

void RememberSchedulePath(const std::string& path)
{
    if (!path.empty())
        RememberedPath() = path;
}

std::string EstimateSchedulePath()
{
    if (!RememberedPath().empty())
        return RememberedPath();
    const std::string stored = velGetPrivateProfileString(kSettingsSection, "Bordereau", "", SettingsFile(), 4096);
    if (!stored.empty())
        return stored;
    std::string found;
    return acedFindFile("VelaBordereau.xml", found) == RTNORM ? found : std::string();
}

int FillArticles(const std::string& path, std::vector<CZodEVIArticle*>* table)
{
    if (table == nullptr)
        return 2;
    ArticleVector articles;
    if (VelReadResult read = ReadScheduleFile(path, articles); !read) {
        acutPrintf("%s\n", read.description().c_str());
        return 1;
    }
    RememberSchedulePath(path);
    table->reserve(table->size() + articles.size());
    for (auto& article : articles)
        table->push_back(article.release());
    return 0;
}

int ExportArticles(const std::string& path, const std::vector<CZodEVIArticle*>* table)
{
    if (table == nullptr)
        return 2;
    const std::vector<const CZodEVIArticle*> articles(table->begin(), table->end());
    if (VelReadResult written = WriteScheduleFile(path, articles); !written) {
        acutPrintf("%s\n", written.description().c_str());
        return 1;
    }
    RememberSchedulePath(path);
    return 0;
}

int ShowEstimate(const std::string& name, const std::vector<CZodEVIAssocLine*>* lines)
{
    AcApDocument* document = acDocManager->curDocument();
    AcDbDatabase* database = document != nullptr ? document->database() : nullptr;
    if (database == nullptr) {
        acutPrintf("Devis « %s » : aucun dessin ouvert.\n", name.c_str());
        return 1;
    }
    if (!IsFileName(name)) {
        acutPrintf("Devis « %s » : ce nom ne peut pas servir de nom de fichier.\n", name.c_str());
        return 1;
    }
    std::string drawing = document->fileName().empty() ? database->fileName() : document->fileName();
    std::filesystem::path folder = std::filesystem::path(drawing).parent_path();
    if (folder.empty())
        folder = std::filesystem::current_path();

    ArticleVector schedule;
    const std::string schedulePath = EstimateSchedulePath();
    if (VelReadResult read = ReadScheduleFile(schedulePath, schedule); !read)
        acutPrintf("Devis « %s » : %s Les taux de TVA sont pris à 19,6 %%.\n", name.c_str(),
                   read.description().c_str());

    const ProjectTables projects = ProjectTables::Read(*database);
    Estimate estimate = BuildEstimate(name, lines ? *lines : std::vector<CZodEVIAssocLine*>(), projects, schedule);
    estimate.drawing = drawing.empty() ? document->docTitle() : drawing;
    estimate.date = Today();

    const std::string currency = CurrencySymbol();
    const std::string workbook = (folder / (name + ".xlsx")).string();
    const std::string csv = (folder / (name + ".csv")).string();
    for (const VelReadResult& written :
         {WriteEstimateWorkbook(workbook, estimate, currency), WriteEstimateCsv(csv, estimate)}) {
        if (!written) {
            acutPrintf("Devis « %s » : %s\n", name.c_str(), written.description().c_str());
            return 1;
        }
    }
    std::string error;
    const EstimateRecord record{
        name, workbook, csv, static_cast<int>(estimate.RowCount()), estimate.totalExclTax, estimate.totalInclTax};
    const bool recorded = RecordEstimate(*database, record, error);

    for (const std::string& line : EstimateSummary(estimate, currency, workbook, csv))
        acutPrintf("%s\n", line.c_str());
    if (!recorded) {
        acutPrintf("%s\n", error.c_str());
        return 1;
    }
    return 0;
}

int ListEstimates(std::vector<std::string>* names)
{
    if (names == nullptr)
        return 2;
    names->clear();
    AcApDocument* document = acDocManager->curDocument();
    if (document == nullptr || document->database() == nullptr)
        return 0;
    for (const EstimateRecord& record : RecordedEstimates(*document->database()))
        names->push_back(record.name);
    return 0;
}

} // namespace metre

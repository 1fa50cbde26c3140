// Reading and writing schedules of 1,000 to 100,000 articles through the exchange (the
// store's Read and Write, the metre module's XML file behind them), side by side with a
// bare pugixml parse and save of the same file, and their ratios.
#include "schedule/schedule_exchange.hpp"

#include "ratio_reporter.hpp"

#include "metre_services.hpp"
#include "schedule_file.hpp"
#include "module/siblings.hpp"
#include "text/text.hpp"
#include "velhost/rx.h"

#include <benchmark/benchmark.h>
#include <pugixml.hpp>

#include <climits>
#include <filesystem>
#include <malloc.h>
#include <unistd.h>

using namespace zodevi;

namespace {

namespace fs = std::filesystem;

std::int32_t Fill(std::string file, std::vector<CZodEVIArticle*>* table, std::int32_t)
{
    return metre::FillArticles(file, table);
}

std::int32_t Export(std::string file, std::vector<CZodEVIArticle*>* table, std::int32_t)
{
    return metre::ExportArticles(file, table);
}

fs::path Folder()
{
    static const fs::path folder = [] {
        fs::path f = fs::temp_directory_path() / "bench_schedule_exchange";
        fs::create_directories(f);
        return f;
    }();
    return folder;
}

// What this run writes, apart from the files of other runs on the machine: a file left
// by another run is one this run never read, which the writer rightly refuses to replace.
fs::path OutputFolder()
{
    static const fs::path folder = [] {
        fs::path f = Folder() / FormatString("run-%ld", static_cast<long>(getpid()));
        fs::remove_all(f);
        fs::create_directories(f);
        return f;
    }();
    return folder;
}

// A schedule of n articles as a network update leaves it, written once per size.
std::string ScheduleFile(std::int64_t n)
{
    const std::string path = (Folder() / FormatString("bordereau_%lld.xml", static_cast<long long>(n))).string();
    if (fs::exists(path))
        return path;
    CZodEVIBdr bdr;
    bdr.path = path;
    for (std::int64_t i = 0; i < n; ++i) {
        auto a = std::make_unique<CZodEVIArticle>();
        const std::string network = FormatString("EU%lld", static_cast<long long>(i % 20));
        a->code = FormatString("EU-%03lld", static_cast<long long>(i % 1000 + 1));
        a->number = static_cast<int>(i + 1);
        a->unitPrice = 10 + (i % 997) * 0.37;
        a->designation = FormatString("Tuyau PVC %lld « assainissement »", static_cast<long long>(100 + i % 400));
        a->description = "Article associé aux réseaux EU.\r\nFourniture et pose, y compris lit de pose.";
        a->unit = "ml";
        a->quantityKey = FormatString("\"RSX_TUY_LIN_3D_PVC %lld\"", static_cast<long long>(i));
        a->groupKey = "PRJ_RES(" + network + ")";
        a->treePath = "Réseaux\\\\" + network + "\\\\Canalisations\\\\Linéaire\\\\" + a->code + " - " + a->designation;
        bdr.GroupOf(a->groupKey, true)->push_back(bdr.AddArticle(std::move(a)));
    }
    Write(bdr);
    return path;
}

void RegisterMetre()
{
    static bool done = false;
    if (done)
        return;
    velRegisterInProcessService(kVelMetreServicesName, new AcRxService(),
                                {{"VtMetre_RemplitTableau", reinterpret_cast<void*>(&Fill)},
                                 {"VtMetre_ExporterXml", reinterpret_cast<void*>(&Export)}});
    SetBdrMetre(&MetreModule());
    done = true;
}

void BM_Read(benchmark::State& state)
{
    RegisterMetre();
    CZodEVIBdr bdr;
    bdr.path = ScheduleFile(state.range(0));
    Read(bdr); // the session has read it before: memory as in use, not fresh
    for (auto _ : state) {
        if (!Read(bdr))
            state.SkipWithError("Read failed");
        benchmark::DoNotOptimize(bdr.Articles().size());
    }
    state.SetBytesProcessed(static_cast<std::int64_t>(state.iterations() * fs::file_size(bdr.path)));
}

// The metre module's reading of the file alone, without the store.
void BM_ReadFile(benchmark::State& state)
{
    const std::string path = ScheduleFile(state.range(0));
    metre::ArticleVector previous;
    metre::ReadScheduleFile(path, previous);
    previous.clear();
    for (auto _ : state) {
        metre::ArticleVector articles;
        if (!metre::ReadScheduleFile(path, articles))
            state.SkipWithError("read failed");
        benchmark::DoNotOptimize(articles.data());
    }
    state.SetBytesProcessed(static_cast<std::int64_t>(state.iterations() * fs::file_size(path)));
}

void BM_BareParse(benchmark::State& state)
{
    const std::string path = ScheduleFile(state.range(0));
    pugi::xml_document().load_file(path.c_str());
    for (auto _ : state) {
        pugi::xml_document document;
        if (!document.load_file(path.c_str()))
            state.SkipWithError("parse failed");
        benchmark::DoNotOptimize(document.first_child());
    }
    state.SetBytesProcessed(static_cast<std::int64_t>(state.iterations() * fs::file_size(path)));
}

void BM_Write(benchmark::State& state)
{
    RegisterMetre();
    CZodEVIBdr bdr;
    bdr.path = ScheduleFile(state.range(0));
    Read(bdr);
    // Created by the first write, then replaced as a user saving again replaces it: each
    // timed write checks the file against the version written, locks, syncs and keeps a
    // backup.
    bdr.path = (OutputFolder() / "written.xml").string();
    fs::remove(bdr.path);
    fs::remove(bdr.path + ".bak");
    if (!Write(bdr))
        state.SkipWithError("first Write failed");
    for (auto _ : state)
        if (!Write(bdr))
            state.SkipWithError("Write failed");
    state.SetBytesProcessed(static_cast<std::int64_t>(state.iterations() * fs::file_size(bdr.path)));
}

void BM_BareSave(benchmark::State& state)
{
    const std::string path = ScheduleFile(state.range(0));
    pugi::xml_document document;
    document.load_file(path.c_str());
    const std::string out = (OutputFolder() / "saved.xml").string();
    document.save_file(out.c_str());
    for (auto _ : state)
        if (!document.save_file(out.c_str()))
            state.SkipWithError("save failed");
    state.SetBytesProcessed(static_cast<std::int64_t>(state.iterations() * fs::file_size(out)));
}

BENCHMARK(BM_Read)->Arg(1000)->Arg(10000)->Arg(100000)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_ReadFile)->Arg(1000)->Arg(10000)->Arg(100000)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_BareParse)->Arg(1000)->Arg(10000)->Arg(100000)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_Write)->Arg(1000)->Arg(10000)->Arg(100000)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_BareSave)->Arg(1000)->Arg(10000)->Arg(100000)->Unit(benchmark::kMillisecond);

} // namespace

int main(int argc, char** argv)
{
    // Both sides get a heap that keeps its pages once touched. Otherwise whether a size
    // pays for page faults at each pass depends on what ran before it in the process,
    // which turned the same parse from 0.1 s into 1.1 s on this machine.
    mallopt(M_MMAP_MAX, 0);
    mallopt(M_TRIM_THRESHOLD, INT_MAX);
    std::vector<RatioReporter::Ratio> ratios;
    for (const char* n : {"1000", "10000", "100000"}) {
        ratios.push_back({std::string("Read / parse, ") + n + " articles", std::string("BM_Read/") + n,
                          std::string("BM_BareParse/") + n});
        ratios.push_back({std::string("metre file read / parse, ") + n + " articles", std::string("BM_ReadFile/") + n,
                          std::string("BM_BareParse/") + n});
        ratios.push_back({std::string("Write / save, ") + n + " articles", std::string("BM_Write/") + n,
                          std::string("BM_BareSave/") + n});
    }
    const int status = RunWithRatios(argc, argv, std::move(ratios));
    std::error_code error;
    fs::remove_all(OutputFolder(), error);
    return status;
}

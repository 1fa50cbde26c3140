// A rebuild of the quantities dialog's article tree, as every click on a project makes:
// a 10,000-article road schedule and 100 checked road projects of 200 quantity keys each,
// in both quantity modes.
#include "ui/quantities_dialog.hpp"

#include "text/text.hpp"

#include <benchmark/benchmark.h>

#include <string>

using namespace zodevi;

namespace {

constexpr int kArticles = 10000;
constexpr int kProjects = 100;
constexpr int kKeysPerProject = 200;

// 20 chapters of 25 sections of 20 articles, each article counting its own key.
void FillSchedule(CZodEVIBdr& bdr)
{
    CZodEVIGroup* group = bdr.GroupOf(MakeRoadGroupKey(), true);
    for (int i = 0; i < kArticles; ++i) {
        auto article = std::make_unique<CZodEVIArticle>();
        article->number = i + 1;
        article->nature = i % 7 == 0 ? kNatureLinear : kNatureVolume;
        article->code = FormatString("GC-%05d", i);
        article->designation = FormatString("Article %d", i);
        article->unit = "m³";
        article->unitPrice = 10 + i % 50;
        article->quantityKey = MakeQuantityKey(FormatString("PRJ_VOL_%05d", i));
        article->groupKey = MakeRoadGroupKey();
        const std::string category = FormatString("Voirie\\\\Chapitre %02d\\\\Section %02d%s", i / 500, i / 20 % 25,
                                                  MakeNatureLevel(article->nature).c_str());
        article->treePath = MakeTreePath(category, article->code, article->designation);
        group->push_back(bdr.AddArticle(std::move(article)));
    }
}

void BM_RefillArticleTree(benchmark::State& state)
{
    CZodEVIBdr bdr;
    FillSchedule(bdr);
    DlgMetExpArt dialog(nullptr, &bdr);
    dialog.LoadArticleLists();
    for (int p = 0; p < kProjects; ++p) {
        const std::string name = FormatString("Projet %03d", p);
        velproj::QuantityTable& table = dialog.m_roadProjects.Get(name);
        for (int k = 0; k < kKeysPerProject; ++k)
            table.Set(MakeQuantityKey(FormatString("PRJ_VOL_%05d", (p * 97 + k * 53) % kArticles)), 1.5 + k);
        dialog.m_roadSelection.checkedNames[name] = name;
    }
    dialog.m_nQuantityMode = static_cast<int>(state.range(0));
    for (auto _ : state) {
        dialog.RefillArticleTree();
        benchmark::DoNotOptimize(dialog.m_treeArticles.GetCount());
    }
    state.counters["articles"] = static_cast<double>(dialog.m_itemLines.size());
    state.counters["items"] = static_cast<double>(dialog.m_treeArticles.GetCount());
}
BENCHMARK(BM_RefillArticleTree)->Arg(0)->Arg(1)->Unit(benchmark::kMillisecond);

} // namespace

BENCHMARK_MAIN();

// Update network with 200 pipe models and 10 depth bounds into schedules of 1,000 to
// 100,000 articles: a new network (every article created), the same update repeated
// (nothing created, with and without purge), and growth with the network's own size,
// with the ratios to the 450-article network.
#include "generation/network_update.hpp"

#include "ratio_reporter.hpp"

#include "text/text.hpp"

#include <benchmark/benchmark.h>

#include <string>
#include <vector>

using namespace zodevi;

namespace {

constexpr int kArticlesPerFillerNetwork = 500;

// A schedule of `count` articles spread over filler networks, numbered 1..count, as a
// read schedule would be.
void FillSchedule(CZodEVIBdr& bdr, int count)
{
    CZodEVIGroup* group = nullptr;
    std::string groupKey;
    for (int i = 0; i < count; ++i) {
        if (i % kArticlesPerFillerNetwork == 0) {
            groupKey = MakeNetworkGroupKey(FormatString("Réseau %d", i / kArticlesPerFillerNetwork));
            group = bdr.GroupOf(groupKey, true);
            bdr.SetNetworkIndex(groupKey, 1);
        }
        auto article = std::make_unique<CZodEVIArticle>();
        article->number = i + 1;
        article->code = FormatString("EU-%03d", static_cast<int>(group->size()) + 1);
        article->designation = FormatString("Fourniture et pose des canalisations M%d", i);
        article->quantityKey = MakeQuantityKey(FormatString("RSX_TUY_LIN_3D_M%d", i));
        article->groupKey = groupKey;
        article->treePath = MakeTreePath("Réseau\\\\Canalisation EU\\\\Linéaire", article->code, article->designation);
        group->push_back(bdr.AddArticle(std::move(article)));
    }
    bdr.nextNumber = count + 1;
}

std::vector<std::string> Models(int count)
{
    std::vector<std::string> models;
    for (int i = 0; i < count; ++i)
        models.push_back(FormatString("PVC DN%d", 100 + i));
    return models;
}

CZodEVIValueArray<double> Bounds()
{
    CZodEVIValueArray<double> bounds;
    for (int i = 0; i < 10; ++i)
        bounds.Add(1.0 + 0.25 * i);
    return bounds;
}

bool Run(CZodEVIBdr& bdr, const std::vector<std::string>& models, const CZodEVIValueArray<double>& bounds)
{
    return UpdateNetwork(bdr, 1, "EU bench", models, {}, {}, {}, {}, {}, bounds);
}

// A new network: every one of its ~440 articles is created.
void BM_UpdateNetworkNew(benchmark::State& state)
{
    const int size = static_cast<int>(state.range(0));
    const auto models = Models(200);
    const auto bounds = Bounds();
    CZodEVIBdr bdr;
    FillSchedule(bdr, size);
    CZodEVIGroup* group = bdr.GroupOf(MakeNetworkGroupKey("EU bench"), true);
    for (auto _ : state) {
        benchmark::DoNotOptimize(Run(bdr, models, bounds));
        state.PauseTiming();
        state.counters["created"] = static_cast<double>(group->size());
        bdr.RemoveArticles(std::vector<const CZodEVIArticle*>(group->begin(), group->end()));
        bdr.nextNumber = size + 1;
        state.ResumeTiming();
    }
}

// The usual call: the network is up to date and nothing changes.
void BM_UpdateNetworkRepeat(benchmark::State& state)
{
    const int size = static_cast<int>(state.range(0));
    SetPurgeFlag(state.range(1) != 0);
    const auto models = Models(200);
    const auto bounds = Bounds();
    CZodEVIBdr bdr;
    FillSchedule(bdr, size);
    Run(bdr, models, bounds);
    for (auto _ : state)
        benchmark::DoNotOptimize(Run(bdr, models, bounds));
    SetPurgeFlag(false);
}

// Growth with the network's own group: the same repeated update with more models, in a
// schedule of 10,000 articles. 200 models make a group of 450 articles, 12,475 one of
// 25,000.
void BM_UpdateNetworkGroupSize(benchmark::State& state)
{
    const auto models = Models(static_cast<int>(state.range(0)));
    const auto bounds = Bounds();
    CZodEVIBdr bdr;
    FillSchedule(bdr, 10000);
    Run(bdr, models, bounds);
    state.counters["group"] = static_cast<double>(bdr.GroupOf(MakeNetworkGroupKey("EU bench"), false)->size());
    for (auto _ : state)
        benchmark::DoNotOptimize(Run(bdr, models, bounds));
}

BENCHMARK(BM_UpdateNetworkNew)->Arg(1000)->Arg(10000)->Arg(100000)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_UpdateNetworkRepeat)
    ->ArgsProduct({{1000, 10000, 100000}, {0, 1}})
    ->ArgNames({"articles", "purge"})
    ->Unit(benchmark::kMillisecond);
BENCHMARK(BM_UpdateNetworkGroupSize)->Arg(200)->Arg(800)->Arg(3200)->Arg(12475)->Unit(benchmark::kMillisecond);

} // namespace

int main(int argc, char** argv)
{
    return RunWithRatios(
        argc, argv,
        {{"repeat, group 1,650 / 450", "BM_UpdateNetworkGroupSize/800", "BM_UpdateNetworkGroupSize/200"},
         {"repeat, group 6,450 / 450", "BM_UpdateNetworkGroupSize/3200", "BM_UpdateNetworkGroupSize/200"},
         {"repeat, group 25,000 / 450", "BM_UpdateNetworkGroupSize/12475", "BM_UpdateNetworkGroupSize/200"},
         {"new network, 100,000 / 1,000 articles", "BM_UpdateNetworkNew/100000", "BM_UpdateNetworkNew/1000"}});
}

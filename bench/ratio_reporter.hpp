// The usual console table, followed by the ratios between benchmarks that the goals
// are stated in, all from the same run (CPU time; the median when runs are repeated).
#pragma once

#include <benchmark/benchmark.h>

#include <cstdio>
#include <map>
#include <string>
#include <utility>
#include <vector>

class RatioReporter : public benchmark::ConsoleReporter {
public:
    // A line "label: numerator ÷ denominator", both named as the table names them.
    struct Ratio {
        std::string label;
        std::string numerator;
        std::string denominator;
    };

    explicit RatioReporter(std::vector<Ratio> ratios) : ratios_(std::move(ratios)) {}

    void ReportRuns(const std::vector<Run>& runs) override
    {
        for (const Run& run : runs) {
            if (run.iterations == 0 || run.error_occurred)
                continue;
            const bool median = run.run_type == Run::RT_Aggregate && run.aggregate_name == "median";
            if (run.run_type == Run::RT_Iteration && run.repetitions > 1)
                continue;
            if (run.run_type == Run::RT_Aggregate && !median)
                continue;
            cpuMs_[run.run_name.str()] = run.GetAdjustedCPUTime() * Scale(run.time_unit);
        }
        ConsoleReporter::ReportRuns(runs);
    }

    void Finalize() override
    {
        ConsoleReporter::Finalize();
        std::printf("\nRatios of CPU times:\n");
        for (const Ratio& ratio : ratios_) {
            const auto n = cpuMs_.find(ratio.numerator);
            const auto d = cpuMs_.find(ratio.denominator);
            if (n == cpuMs_.end() || d == cpuMs_.end() || d->second <= 0)
                continue;
            std::printf("  %-40s %10.3f ms / %10.3f ms = %7.2f\n", ratio.label.c_str(), n->second, d->second,
                        n->second / d->second);
        }
        std::fflush(stdout);
    }

private:
    static double Scale(benchmark::TimeUnit unit)
    {
        switch (unit) {
        case benchmark::kNanosecond:
            return 1e-6;
        case benchmark::kMicrosecond:
            return 1e-3;
        case benchmark::kMillisecond:
            return 1;
        case benchmark::kSecond:
            return 1e3;
        }
        return 1;
    }

    std::vector<Ratio> ratios_;
    std::map<std::string, double> cpuMs_;
};

// BENCHMARK_MAIN with the ratios printed after the table.
inline int RunWithRatios(int argc, char** argv, std::vector<RatioReporter::Ratio> ratios)
{
    benchmark::Initialize(&argc, argv);
    if (benchmark::ReportUnrecognizedArguments(argc, argv))
        return 1;
    RatioReporter reporter(std::move(ratios));
    benchmark::RunSpecifiedBenchmarks(&reporter);
    benchmark::Shutdown();
    return 0;
}

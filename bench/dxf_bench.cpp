// DXF benchmark: reading and writing one large drawing with the host's reader and
// writer, side by side with dxflib (reading), ezdxf (reading and writing, in its own
// process) and `cat` as the raw limit. Throughput is reported as bytes per second.
#include <benchmark/benchmark.h>
#include <dl_creationadapter.h>
#include <dl_dxf.h>
#include <sys/resource.h>

#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <string>

#include "velhost/dbase.h"

namespace {

const std::string kFile = VEL_BENCH_DXF;

std::int64_t FileSize()
{
    std::ifstream in(kFile, std::ios::binary | std::ios::ate);
    return static_cast<std::int64_t>(in.tellg());
}

// Resident memory of the process now, in bytes.
double ResidentBytes()
{
    long pages = 0;
    long resident = 0;
    if (FILE* f = std::fopen("/proc/self/statm", "r")) {
        if (std::fscanf(f, "%ld %ld", &pages, &resident) != 2)
            resident = 0;
        std::fclose(f);
    }
    return static_cast<double>(resident) * 4096.0;
}

void BM_VelRead(benchmark::State& state)
{
    double peakExtra = 0;
    for (auto _ : state) {
        const double before = ResidentBytes();
        std::unique_ptr<AcDbDatabase> db;
        if (const VelReadResult read = velOpenDrawing(kFile, db); !read) {
            state.SkipWithError(read.description().c_str());
            return;
        }
        // What the quantity take-off reads: every project record of the networks.
        AcDbDictionary* nod = nullptr;
        db->getNamedObjectsDictionary(nod, AcDb::kForRead);
        AcDbObject* rsx = nullptr;
        if (nod->getAt("VELANTO_RSX_VRD", rsx, AcDb::kForRead) == Acad::eOk) {
            AcDbObject* projects = nullptr;
            if (static_cast<AcDbDictionary*>(rsx)->getAt("PROJECTS", projects, AcDb::kForRead) == Acad::eOk) {
                std::unique_ptr<AcDbDictionaryIterator> it(static_cast<AcDbDictionary*>(projects)->newIterator());
                for (; !it->done(); it->next()) {
                    AcDbObject* record = nullptr;
                    if (it->getObject(record, AcDb::kForRead) == Acad::eOk) {
                        VelRbPtr xd(record->xData("DAZUVUVUD"));
                        benchmark::DoNotOptimize(xd.get());
                        record->close();
                    }
                }
                projects->close();
            }
            rsx->close();
        }
        nod->close();
        peakExtra = std::max(peakExtra, ResidentBytes() - before);
        benchmark::DoNotOptimize(db.get());
    }
    state.SetBytesProcessed(state.iterations() * FileSize());
    state.counters["memoire_x_fichier"] = peakExtra / static_cast<double>(FileSize());
}
BENCHMARK(BM_VelRead)->Unit(benchmark::kMillisecond)->MinTime(2.0)->UseRealTime();

void BM_VelWrite(benchmark::State& state)
{
    std::unique_ptr<AcDbDatabase> db;
    if (const VelReadResult read = velOpenDrawing(kFile, db); !read) {
        state.SkipWithError(read.description().c_str());
        return;
    }
    // One changed record and one changed setting, so that the writer does real work.
    db->setOsmode(db->osmode() ^ 1);
    AcDbDictionary* nod = nullptr;
    db->getNamedObjectsDictionary(nod, AcDb::kForWrite);
    auto* record = new AcDbXrecord;
    AcDbObjectId id;
    nod->setAt("BANC_ESSAI", record, id);
    VelRbBuilder list;
    list.add(velRbString(1001, "DAZUVUVUD")).add(velRbString(1000, "PRJ_NOM")).add(velRbString(1000, "Banc"));
    record->setXData(list.head());
    record->close();
    nod->close();
    const std::string out = kFile + ".copie.dxf";
    std::string error;
    for (auto _ : state) {
        if (!velSaveDrawing(*db, out, error)) {
            state.SkipWithError(error.c_str());
            return;
        }
    }
    std::remove(out.c_str());
    state.SetBytesProcessed(state.iterations() * FileSize());
}
BENCHMARK(BM_VelWrite)->Unit(benchmark::kMillisecond)->MinTime(2.0)->UseRealTime();

// Reads every entity through dxflib's callbacks without keeping them.
class Discard : public DL_CreationAdapter {
public:
    void addLine(const DL_LineData&) override { ++count; }
    void addCircle(const DL_CircleData&) override { ++count; }
    void addText(const DL_TextData&) override { ++count; }
    void addVertex(const DL_VertexData&) override { ++count; }
    long count = 0;
};

void BM_DxflibRead(benchmark::State& state)
{
    for (auto _ : state) {
        Discard discard;
        DL_Dxf dxf;
        if (!dxf.in(kFile, &discard)) {
            state.SkipWithError("dxflib ne lit pas le fichier");
            return;
        }
        benchmark::DoNotOptimize(discard.count);
    }
    state.SetBytesProcessed(state.iterations() * FileSize());
}
BENCHMARK(BM_DxflibRead)->Unit(benchmark::kMillisecond)->Iterations(3)->UseRealTime();

// ezdxf runs in its own process; its own clock times the reading and the writing.
void BM_Ezdxf(benchmark::State& state)
{
    const bool write = state.range(0) == 1;
    static double readSeconds = 0;
    static double writeSeconds = 0;
    if (readSeconds == 0) {
        const std::string command = std::string("/usr/bin/python3 ") + VEL_EZDXF_TIME + " " + kFile;
        FILE* pipe = popen(command.c_str(), "r");
        if (pipe == nullptr || std::fscanf(pipe, "%lf %lf", &readSeconds, &writeSeconds) != 2) {
            if (pipe)
                pclose(pipe);
            state.SkipWithError("ezdxf n'a pas répondu");
            return;
        }
        pclose(pipe);
    }
    for (auto _ : state)
        state.SetIterationTime(write ? writeSeconds : readSeconds);
    state.SetBytesProcessed(state.iterations() * FileSize());
    state.SetLabel(write ? "ecriture" : "lecture");
}
BENCHMARK(BM_Ezdxf)->Arg(0)->Arg(1)->UseManualTime()->Iterations(1)->Unit(benchmark::kMillisecond);

void BM_Cat(benchmark::State& state)
{
    const std::string command = "cat '" + kFile + "' > /dev/null";
    for (auto _ : state)
        if (std::system(command.c_str()) != 0) {
            state.SkipWithError("cat a échoué");
            return;
        }
    state.SetBytesProcessed(state.iterations() * FileSize());
}
BENCHMARK(BM_Cat)->Unit(benchmark::kMillisecond)->Iterations(5)->UseRealTime();

} // namespace

BENCHMARK_MAIN();

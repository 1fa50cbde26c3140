// Computing the quantities of network projects and filing them in the drawing as the
// project records that the estimate reads.
#include "network_records.hpp"

#include <cmath>
#include <climits>
#include <memory>

#include "text/text.hpp"

namespace network {

namespace {

// Closes an opened object on every way out.
struct Closer {
    AcDbObject* object = nullptr;
    ~Closer()
    {
        if (object != nullptr)
            object->close();
    }
};

// Millimetres are enough for lengths and volumes; fewer digits than the sums carry.
double Rounded(double value)
{
    return std::round(value * 1000.0) / 1000.0;
}

// Quantities of one family by model, in the order the models first appear.
struct ByModel {
    std::vector<std::string> models;
    std::vector<double> lengths;
    std::vector<double> counts;

    std::size_t Slot(const std::string& model)
    {
        for (std::size_t i = 0; i < models.size(); ++i)
            if (EqualsNoCase(models[i], model))
                return i;
        models.push_back(model);
        lengths.push_back(0);
        counts.push_back(0);
        return models.size() - 1;
    }
};

double ElementCount(const Element& element)
{
    if (!IsLinear(element.kind))
        return 1;
    // A run that exceeds whole elements by less than a centimetre (a slope, a rounded
    // coordinate) is taken up in the manholes' walls, not by one more element.
    return std::max(1.0, std::ceil((element.length3d - 0.01) / element.usefulLength));
}

std::string RecordKey(const std::string& projectName)
{
    std::string key = projectName;
    for (char& c : key)
        if (c == '\r' || c == '\n')
            c = ' ';
    return key;
}

resbuf* RecordData(const std::string& projectName, const std::vector<Quantity>& quantities)
{
    VelRbBuilder builder;
    builder.add(velRbString(kXdRegAppName, kRecordApp));
    builder.add(velRbString(kXdAsciiString, velproj::kNameMarker));
    builder.add(velRbString(kXdAsciiString, projectName));
    for (const Quantity& q : quantities) {
        builder.add(velRbString(kXdAsciiString, q.key));
        if (q.count && q.value <= INT32_MAX)
            builder.add(velRbLong(kXdInteger32, static_cast<std::int32_t>(q.value)));
        else
            builder.add(velRbReal(kXdReal, q.value));
    }
    return builder.release();
}

// The sub-dictionary under key, opened for write; created when missing.
bool OpenOrCreate(AcDbDictionary* parent, const char* key, AcDbDictionary*& out, std::string& error)
{
    out = nullptr;
    AcDbObject* object = nullptr;
    if (parent->has(key)) {
        const Acad::ErrorStatus status = parent->getAt(key, object, AcDb::kForWrite);
        if (status != Acad::eOk) {
            error = FormatString("dictionnaire %s inaccessible (%s)", key, acadErrorStatusText(status));
            return false;
        }
        out = dynamic_cast<AcDbDictionary*>(object);
        if (out == nullptr) {
            object->close();
            error = FormatString("l'entrée %s du dessin n'est pas un dictionnaire", key);
            return false;
        }
        return true;
    }
    auto created = std::make_unique<AcDbDictionary>();
    AcDbObjectId id;
    const Acad::ErrorStatus status = parent->setAt(key, created.get(), id);
    if (status != Acad::eOk) {
        error = FormatString("dictionnaire %s impossible à créer (%s)", key, acadErrorStatusText(status));
        return false;
    }
    out = created.release(); // the drawing owns it now, open for write
    return true;
}

bool WriteRecord(AcDbDictionary* projects, const std::string& name, const std::vector<Quantity>& quantities,
                 std::string& error)
{
    const std::string key = RecordKey(name);
    VelRbPtr data(RecordData(name, quantities));
    AcDbObject* record = nullptr;
    Acad::ErrorStatus status;
    if (projects->has(key)) {
        status = projects->getAt(key, record, AcDb::kForWrite);
    } else {
        auto created = std::make_unique<AcDbXrecord>();
        AcDbObjectId id;
        status = projects->setAt(key, created.get(), id);
        if (status == Acad::eOk)
            record = created.release();
    }
    if (status != Acad::eOk) {
        error =
            FormatString("enregistrement du projet « %s » impossible (%s)", name.c_str(), acadErrorStatusText(status));
        return false;
    }
    Closer closer{record};
    status = record->setXData(data.get());
    if (status != Acad::eOk) {
        error = FormatString("quantités du projet « %s » refusées par le dessin (%s)", name.c_str(),
                             acadErrorStatusText(status));
        return false;
    }
    return true;
}

} // namespace

std::string QuantityKey(const std::string& name)
{
    return "\"" + name + "\"";
}

std::vector<Quantity> ProjectQuantities(const Project& project, const std::vector<double>& depthBounds)
{
    ByModel pipes, ducts, pipeSupplies, fittings, fittingSupplies;
    double totalLength = 0, trenchVolume = 0;
    bool anyDepth = false;
    const std::size_t classes = depthBounds.empty() ? 0 : depthBounds.size(); // pairs, then "over the last"
    std::vector<double> classLength(classes, 0.0), classVolume(classes, 0.0);
    for (const Element& element : project.elements) {
        ByModel* family = nullptr;
        switch (element.kind) {
        case ElementKind::Pipe:
            family = &pipes;
            break;
        case ElementKind::Duct:
            family = &ducts;
            break;
        case ElementKind::PipeSupply:
            family = &pipeSupplies;
            break;
        case ElementKind::Fitting:
            family = &fittings;
            break;
        case ElementKind::FittingSupply:
            family = &fittingSupplies;
            break;
        }
        const std::size_t slot = family->Slot(element.model);
        family->lengths[slot] += element.length3d;
        family->counts[slot] += ElementCount(element);
        if (element.kind != ElementKind::Pipe)
            continue;
        totalLength += element.length3d;
        if (!element.depthStart || classes == 0)
            continue;
        anyDepth = true;
        const double depth = (*element.depthStart + element.depthEnd.value_or(*element.depthStart)) / 2.0;
        const double volume = element.length2d * depth * element.trenchWidth;
        trenchVolume += volume;
        // Class i < last: bounds i and i+1; the last class is "over the last bound". A depth
        // below the first bound counts in the first class; one on a bound in the lower class.
        std::size_t cls = classes - 1;
        for (std::size_t i = 1; i < depthBounds.size(); ++i)
            if (depth <= depthBounds[i]) {
                cls = i - 1;
                break;
            }
        classLength[cls] += element.length2d;
        classVolume[cls] += volume;
    }

    std::vector<Quantity> out;
    const auto add = [&](const std::string& name, double value, bool count) {
        out.push_back({QuantityKey(name), count ? value : Rounded(value), count});
    };
    if (!pipes.models.empty())
        add("RSX_LIN_TOT_3D", totalLength, false);
    for (std::size_t i = 0; i < pipes.models.size(); ++i) {
        add("RSX_TUY_LIN_3D_" + pipes.models[i], pipes.lengths[i], false);
        add("RSX_TUY_NB_" + pipes.models[i], pipes.counts[i], true);
    }
    for (std::size_t i = 0; i < ducts.models.size(); ++i) {
        add("RSX_FRX_LIN_3D_" + ducts.models[i], ducts.lengths[i], false);
        add("RSX_FRX_NB_" + ducts.models[i], ducts.counts[i], true);
    }
    for (std::size_t i = 0; i < pipeSupplies.models.size(); ++i)
        add("RSX_TUY_FRNT_LIN_3D_" + pipeSupplies.models[i], pipeSupplies.lengths[i], false);
    for (std::size_t i = 0; i < fittings.models.size(); ++i)
        add("RSX_SBL_NB_" + fittings.models[i], fittings.counts[i], true);
    for (std::size_t i = 0; i < fittingSupplies.models.size(); ++i)
        add("RSX_SBL_FRNT_NB_" + fittingSupplies.models[i], fittingSupplies.counts[i], true);
    if (anyDepth) {
        add("RSX_VOL_FOU", trenchVolume, false);
        for (std::size_t i = 0; i < classes; ++i) {
            if (classLength[i] <= 0)
                continue;
            const bool last = i + 1 == classes;
            const std::string range = last ? FormatReal(depthBounds[i], 2)
                                           : FormatReal(depthBounds[i], 2) + "_" + FormatReal(depthBounds[i + 1], 2);
            add("RSX_LIN_" + range + "_2D", classLength[i], false);
            add("RSX_VOL_" + range, classVolume[i], false);
        }
    }
    return out;
}

bool WriteProjectRecords(AcDbDatabase& database, const NetworkDrawing& drawing, RecordReport& report)
{
    const auto fail = [&](const std::string& what) {
        report.error = FormatString("Métré des réseaux non enregistré dans le dessin : %s.", what.c_str());
        return false;
    };
    AcDbDictionary* named = nullptr;
    Acad::ErrorStatus status = database.getNamedObjectsDictionary(named, AcDb::kForWrite);
    if (status != Acad::eOk)
        return fail(FormatString("dictionnaire des objets nommés inaccessible (%s)", acadErrorStatusText(status)));
    Closer namedCloser{named};
    // Nothing to file and nothing filed before: the drawing stays as it is.
    if (drawing.networks.empty() && !named->has(kNetworksDictionary))
        return true;
    std::string error;
    AcDbDictionary* networks = nullptr;
    if (!OpenOrCreate(named, kNetworksDictionary, networks, error))
        return fail(error);
    Closer networksCloser{networks};
    AcDbDictionary* projects = nullptr;
    if (!OpenOrCreate(networks, kProjectsDictionary, projects, error))
        return fail(error);
    Closer projectsCloser{projects};
    if (!database.isRegApp(kRecordApp) && (status = database.addRegApp(kRecordApp)) != Acad::eOk)
        return fail(FormatString("application %s non enregistrée (%s)", kRecordApp, acadErrorStatusText(status)));

    std::vector<std::string> current;
    for (const Network& network : drawing.networks)
        for (const Project& project : network.projects) {
            const std::vector<Quantity> quantities = ProjectQuantities(project, kDepthBounds);
            if (!WriteRecord(projects, project.name, quantities, error))
                return fail(error);
            current.push_back(RecordKey(project.name));
            RecordReport::Written written{network.name, project.name, quantities.size(), 0, 0};
            for (const Element& element : project.elements) {
                if (element.kind == ElementKind::Pipe)
                    written.pipeLength += element.length3d;
                if (element.kind == ElementKind::Fitting)
                    ++written.fittings;
            }
            report.written.push_back(std::move(written));
        }

    std::vector<std::string> stale;
    std::unique_ptr<AcDbDictionaryIterator> it(projects->newIterator(AcRx::kDictSorted));
    for (; !it->done(); it->next()) {
        bool kept = false;
        for (const std::string& key : current)
            kept = kept || EqualsNoCase(key, it->name());
        if (!kept)
            stale.push_back(it->name());
    }
    for (const std::string& key : stale) {
        if ((status = projects->remove(key)) != Acad::eOk)
            return fail(FormatString("ancien projet « %s » impossible à retirer (%s)", key.c_str(),
                                     acadErrorStatusText(status)));
        report.removed.push_back(key);
    }
    return true;
}

int WriteNetworkQuantities(AcDbDatabase& database, RecordReport& report, std::vector<std::string>& warnings)
{
    const NetworkDrawing drawing = NetworkDrawing::Read(database);
    warnings = drawing.warnings;
    return WriteProjectRecords(database, drawing, report) ? 0 : 2;
}

int ProjectsOfNetwork(AcDbDatabase* database, const std::string* networkName, std::vector<std::string>* projects)
{
    if (networkName == nullptr || projects == nullptr)
        return 2;
    projects->clear();
    if (database == nullptr)
        return 1;
    const NetworkDrawing drawing = NetworkDrawing::Read(*database);
    const Network* network = drawing.FindNetwork(*networkName);
    if (network == nullptr || network->projects.empty())
        return 1;
    for (const Project& project : network->projects)
        projects->push_back(project.name);
    SortStrings(*projects, false);
    return 0;
}

} // namespace network

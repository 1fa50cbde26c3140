// The 53 templates of the standard catalogue, as data: one row per template, with the
// per-network category patterns, prefixes and texts in tables of their own.
#include "schedule/catalogue.hpp"

#include "schedule/article.hpp"

#include <string>
#include <string_view>

namespace zodevi {

namespace {

// Category pattern families of the network-dependent templates.
enum class Family { Fixed, Pipe, Fitting, Supply };

// Which network indexes a template has texts for.
enum class Range { Single, All, EpEu, From2 };

struct NetworkColumns {
    const char* prefix;
    const char* pipe;
    const char* fitting;
    const char* supply; // null where the network has no supply articles
};

// The tables stay one row per line.
// clang-format off
// Indexed by network index.
const NetworkColumns kNetworks[kNetworkIndexCount] = {
    {"EP", R"(%s\\Canalisation EP)", R"(%s\\Regard EP)", nullptr},
    {"EU", R"(%s\\Canalisation EU)", R"(%s\\Regard EU)", nullptr},
    {"AEP", R"(%s\\Canalisation adduction eau potable)", R"(%s\\Accessoire adduction eau potable)", R"(%s\\Fourniture adduction eau potable)"},
    {"GAZ", R"(%s\\Canalisation gaz)", R"(%s\\Accessoire gaz)", R"(%s\\Fourniture gaz)"},
    {"BT", R"(%s\\Câble basse tension)", R"(%s\\Accessoire basse tension)", R"(%s\\Fourniture basse tension)"},
    {"BT", R"(%s\\Câble BTB)", R"(%s\\Accessoire BTB)", R"(%s\\Fourniture BTB)"},
    {"CH", R"(%s\\Câble HTA)", R"(%s\\Accessoire HTA)", R"(%s\\Fourniture HTA)"},
    {"CH", R"(%s\\Câble HTB)", R"(%s\\Accessoire HTB)", R"(%s\\Fourniture HTB)"},
    {"TL", R"(%s\\Câble téléphone)", R"(%s\\Accessoire téléphone)", R"(%s\\Fourniture téléphone)"},
    {"TV", R"(%s\\Câble vidéo)", R"(%s\\Accessoire vidéo)", R"(%s\\Fourniture vidéo)"},
    {"EP", R"(%s\\Câble éclairage public)", R"(%s\\Accessoire éclairage public)", R"(%s\\Fourniture éclairage public)"},
    {"CH", R"(%s\\Canalisation chauffage)", R"(%s\\Accessoire chauffage)", R"(%s\\Fourniture chauffage)"},
    {"", R"(%s\\Câble)", R"(%s\\Accessoire)", R"(%s\\Fourniture)"},
};

// Texts that differ by network: the indexes they apply to ("0,1", "2-3,11", "4-10,12"),
// then designation and description.
struct Variant {
    const char* indexes;
    const char* designation;
    const char* description;
};

struct Row {
    int kind;
    int nature;
    const char* code;
    const char* unit;
    const char* designation; // null: from the variants
    const char* description; // null: from the variants
    const char* category;    // for Family::Fixed
    const char* prefix;      // null: the network's prefix
    Family family;
    Range range;
    std::initializer_list<Variant> variants;
};

constexpr const char* kForfait = "Forfait";
constexpr const char* kDemolition = R"(%s\\Travaux de génie civil\\Démolition de chausée)";
constexpr const char* kFoundation = R"(%s\\Travaux de génie civil\\Traitement du sol de fondation)";
constexpr const char* kTrenches = R"(%s\\Travaux de génie civil\\Terrassements\\Tranchées)";
constexpr const char* kShoring = R"(%s\\Travaux de génie civil\\Terrassements\\Protection contre les éboulements)";
constexpr const char* kBedding = R"(%s\\Travaux de génie civil\\Terrassements\\Enrobage et lit de pose)";
constexpr const char* kBackfill = R"(%s\\Travaux de génie civil\\Terrassements\\Remblais et apports)";
constexpr const char* kConnectionTrenches = R"(%s\\Travaux de génie civil\\Terrassements\\Tranchées des branchements)";
constexpr const char* kDuct = R"(%s\\Travaux de génie civil\\Fourreau)";
constexpr const char* kCombDuct = "Fourreau (peigne)";
constexpr const char* kRoadPreparation = R"(Voirie\\Travaux préparatoires)";
constexpr const char* kStripping = R"(Voirie\\Terrassements\\Terre végétale\\Décapage)";
constexpr const char* kVegetation = R"(Voirie\\Terrassements\\Terre végétale\\Végétalisation des talus)";
constexpr const char* kStructure = R"(Voirie\\Matériaux de structure)";
constexpr const char* kExistingRoads = R"(Voirie\\Travaux sur chaussées existantes)";

// Every road-project description starts with the projects it serves.
#define VEL_ROAD_ALL "Article associé aux projets 'multi plates-formes', 'projet linéaire par profils-types' et 'Korvane'.\n"
#define VEL_ROAD_LINEAR "Article associé aux 'projets linéaires par profils-types'.\n"
#define VEL_ROAD_KORVANE "Article associé aux projets 'Korvane'.\n"

constexpr Family F = Family::Fixed;

const Row kCatalogue[] = {
    // 1-21: every network, same texts.
    {0, 6, "", "", "Installation du chantier", kForfait, R"(%s\\Travaux préparatoires)", "TP", F, Range::All, {}},
    {0, 6, "", "", "Piquetage, implantation, sondage", kForfait, R"(%s\\Travaux préparatoires)", "TP", F, Range::All, {}},
    {5, 2, "RSX_LIN_DEC_2D", "ml", "Longueur 2D de découpage", "Encore appelée longueur de sciage, il s'agit de la longueur 2D totale des tronçons de canalisations ayant une structure de décaissement.", kDemolition, "GC", F, Range::All, {}},
    {6, 2, "RSX_LIN_DEC_3D", "ml", "Longueur 3D de découpage", "Encore appelée longueur de sciage, il s'agit de la longueur 3D totale des tronçons de canalisations ayant une structure de décaissement.", kDemolition, "GC", F, Range::All, {}},
    {11, 3, "RSX_SFC_DEC", "m²", "Surface 2D de démolition", "Encore appelée surface de découpe, il s'agit de la surface 2D totale de décaissement des tranchées associées aux tronçons de canalisations ayant une structure de décaissement.", kDemolition, "GC", F, Range::All, {}},
    {18, 4, "RSX_VOL_DEC", "m³", "Volume de démolition", "Volume total de décaissement des tranchées associées aux tronçons de canalisations ayant une structure de décaissement.", kDemolition, "GC", F, Range::All, {}},
    {3, 2, "RSX_LIN_FDT_2D", "ml", "Longueur 2D", "Longueur 2D totale des tronçons de canalisations ayant une structure de fondation.", kFoundation, "GC", F, Range::All, {}},
    {4, 2, "RSX_LIN_FDT_3D", "ml", "Longueur 3D", "Longueur 3D totale des tronçons de canalisations ayant une structure de fondation.", kFoundation, "GC", F, Range::All, {}},
    {14, 4, "RSX_VOL_FDT", "m³", "Volume", "Volume total de fondation des tranchées associées aux tronçons de canalisations ayant une structure de fondation.", kFoundation, "GC", F, Range::All, {}},
    {13, 4, "RSX_VOL_FOU", "m³", "Volume de fouille", "Volume total de fouille des tranchées.", kTrenches, "GC", F, Range::All, {}},
    {21, 4, "RSX_VOL_%.2f_%.2f", "m³", "Volume de fouille %.2f m <= H <= %.2f m", "Volume de fouille des tranchées pour %.2f m <= H <= %.2f m.", kTrenches, "GC", F, Range::All, {}},
    {22, 4, "RSX_VOL_%.2f", "m³", "Volume de fouille H > %.2f m", "Volume de fouille des tranchées pour H > %.2f m.", kTrenches, "GC", F, Range::All, {}},
    {8, 2, "RSX_LIN_%.2f_%.2f_2D", "ml", "Longueur 2D %.2f m <= H <= %.2f m", "Longueur 2D totale des tranchées ayant un volume de fouille pour %.2f m <= H <= %.2f m.", kTrenches, "GC", F, Range::All, {}},
    {9, 2, "RSX_LIN_%.2f_2D", "ml", "Longueur 2D H > %.2f m", "Longueur 2D totale des tranchées ayant un volume de fouille pour H > %.2f m.", kTrenches, "GC", F, Range::All, {}},
    {7, 2, "RSX_LIN_BLI_2D", "ml", "Longueur 2D blindée", "Longueur 2D totale des tranchées blindées.", kShoring, "GC", F, Range::All, {}},
    {12, 3, "RSX_SFC_BLI", "m²", "Surface de blindage", "Surface 2D totale des panneaux de blindage.", kShoring, "GC", F, Range::All, {}},
    {20, 4, "RSX_VOL_BLI", "m³", "Volume de blindage", "Volume total des panneaux de blindage.", kShoring, "GC", F, Range::All, {}},
    {16, 4, "RSX_VOL_EBG", "m³", "Volume d'enrobage", "Volume total d'enrobage des canalisations.", kBedding, "GC", F, Range::All, {}},
    {15, 4, "RSX_VOL_LPO", "m³", "Volume de lit de pose", "Volume total du lit de pose des canalisations.", kBedding, "GC", F, Range::All, {}},
    {17, 4, "RSX_VOL_RBL", "m³", "Volume de remblai", "Volume total de remblai des tranchées associées aux canalisations.", kBackfill, "GC", F, Range::All, {}},
    {19, 4, "RSX_VOL_DEC_%s", "m³", "Volume de %s", "Volume total du matériau %s dans la structure de décaissement.", kBackfill, "GC", F, Range::All, {}},
    // 22-26: same texts, some networks only.
    {34, 4, "RSX_BRA_VOL_FO", "m³", "Volume de fouille", "Volume total de fouille des tranchées associées aux branchements.", kConnectionTrenches, "GC", F, Range::EpEu, {}},
    {35, 4, "RSX_BRA_VOL_%.2f_%.2f", "m³", "Volume de fouille %.2f m <= H <= %.2f m", "Volume de fouille des tranchées associées aux branchements pour %.2f m <= H <= %.2f m.", kConnectionTrenches, "GC", F, Range::EpEu, {}},
    {36, 2, "RSX_BRA_VOL_%.2f", "m³", "Longueur 2D %.2f m <= H <= %.2f m", "Longueur 2D totale des tranchées aassociées aux branchements ayant un volume de fouille pour %.2f m <= H <= %.2f m.", kConnectionTrenches, "GC", F, Range::EpEu, {}},
    {28, 2, "RSX_FRX_LIN_3D_%s", "ml", "Fourniture et pose de fourreau %s", "Longueur 3D totale des fourreaux simples de modèle %s", kDuct, "GC", F, Range::From2, {}},
    {29, 2, "RSX_FRX_NB_%s", "ml", "Nombre de couronnes %s", "Nombre de couronnes nécessaires pour les fourreaux simples de modèle %s (longueur 3D / longueur utile).", kDuct, "GC", F, Range::From2, {}},
    // 27-34: category and prefix by network.
    {2, 2, "RSX_LIN_TOT_3D", "ml", nullptr, nullptr, nullptr, nullptr, Family::Pipe, Range::All, {
        {"0,1", "Longueur 3D des canalisations", "Longueur 3D totale des canalisations ; les branchements ne sont pas pris en compte !"},
        {"2-3,11", "Longueur 3D totale", "Longueur 3D totale des canalisations"},
        {"4-10,12", "Longueur 3D totale", "Longueur 3D totale (SurLongueur comprise) des câbles"}}},
    {32, 2, "RSX_BRA_LIN_3D", "ml", "Longueur 3D des branchements", "Longueur 3D totale des branchements", nullptr, nullptr, Family::Pipe, Range::EpEu, {}},
    {23, 2, "RSX_TUY_LIN_3D_%s", "ml", nullptr, nullptr, nullptr, nullptr, Family::Pipe, Range::All, {
        {"0,1", "Fourniture et pose des canalisations %s", "Longueur 3D totale des canalisations de modèle %s. Les branchements sont pris en compte !"},
        {"2-3,11", "Fourniture et pose des canalisations %s", "Longueur 3D totale des canalisations de modèle %s"},
        {"4-10,12", "Fourniture et pose de câble %s", "Longueur 3D totale (SurLongueur comprise) du câble %s"}}},
    {24, 2, "RSX_TUY_NB_%s", "", nullptr, nullptr, nullptr, nullptr, Family::Pipe, Range::All, {
        {"0,1", "Nombre de tuyaux %s", "Nombre de tuyaux %s utilisés par les canalisations et les branchements (longueur 3D / longueur utile)."},
        {"2-3,11", "Nombre de tuyaux %s", "Nombre de tuyaux %s utilisés par les canalisations (longueur 3D / longueur utile)."},
        {"4-10,12", "Nombre de tourets %s", "Nombre de tourets nécessaires pour les câbles de modèle %s (longueur 3D / longueur utile)."}}},
    {33, 1, "RSX_BRA_BX_NB", "", "Boîtes clients", "Nombre total de boîtes clients", R"(%s\\Branchements)", nullptr, F, Range::EpEu, {}},
    {26, 1, "RSX_SBL_NB_%s", "", nullptr, nullptr, nullptr, nullptr, Family::Fitting, Range::All, {
        {"0,1", "Regards %s", "Nombre total de regards %s"},
        {"2-12", "%s", "Nombre total d'accessoires %s"}}},
    {25, 2, "RSX_TUY_FRNT_LIN_3D_%s", "ml", "%s", nullptr, nullptr, nullptr, Family::Supply, Range::From2, {
        {"2-3", "%s", "Longueur 3D totale de fournitures %s pour tuyau"},
        {"4-12", "%s", "Longueur 3D totale de fournitures %s pour câble"}}},
    {27, 1, "RSX_SBL_FRNT_NB_%s", "", "%s", "Nombre total de fournitures %s pour accessoire", nullptr, nullptr, Family::Supply, Range::From2, {}},
    // 35-53: one text, no network.
    {30, 2, "RSX_PGN_LIN_3D_%s", "ml", "Fourniture et pose du peigne %s", "Longueur 3D totale du peigne de modèle %s", kCombDuct, "GC", F, Range::Single, {}},
    {31, 2, "RSX_PGN_NB_%s", "", "Nombre de couronnes %s", "Nombre de couronnes nécessaires pour les peignes de modèle %s (longueur 3D / longueur utile).", kCombDuct, "GC", F, Range::Single, {}},
    {1, 6, "", "", "Installation du chantier", VEL_ROAD_ALL "Forfait", kRoadPreparation, "TP", F, Range::Single, {}},
    {1, 6, "", "", "Signalisation provisoire du chantier", VEL_ROAD_ALL "Forfait", kRoadPreparation, "TP", F, Range::Single, {}},
    {1, 6, "", "", "Implantation, plan de phasage et contrôle", VEL_ROAD_ALL "Forfait", kRoadPreparation, "TP", F, Range::Single, {}},
    {37, 4, "PRJ_VOL_TOT_DEC_%.3f", "m³", "Volume de décapage sur une épaisseur de %.2f m", VEL_ROAD_ALL "Volume total de décapage sur une épaisseur de %.2f m", kStripping, "GC", F, Range::Single, {}},
    {38, 3, "PRJ_SFC_DEC_3D_%.3f", "m²", "Surface 3D de décapage sur une épaisseur de %.2f m", VEL_ROAD_ALL "Surface 3D totale de décapage sur une épaisseur de %.2f m.", kStripping, "GC", F, Range::Single, {}},
    {39, 4, "PRJ_VOL_TOT_VEG_%.3f", "m³", "Volume de végétalisation sur une épaisseur de %.2f m", VEL_ROAD_ALL "Volume total de végétalisation des talus sur une épaisseur de %.2f m", kVegetation, "GC", F, Range::Single, {}},
    {40, 3, "PRJ_SFC_TOT_VEG_%.3f", "m²", "Surface 3D de végétalisation sur une épaisseur de %.2f m", VEL_ROAD_ALL "Surface 3D totale de végétalisation des talus sur une épaisseur de %.2f m.", kVegetation, "GC", F, Range::Single, {}},
    {41, 4, "PRJ_VOL_TOT_DBL", "m³", "Volume des déblais", VEL_ROAD_ALL "Volume total des déblais.", R"(Voirie\\Terrassements\\Déblais)", "GC", F, Range::Single, {}},
    {42, 4, "PRJ_VOL_TOT_RBL", "m³", "Volume des remblais", VEL_ROAD_ALL "Volume total des remblais.", R"(Voirie\\Terrassements\\Remblais)", "GC", F, Range::Single, {}},
    {43, 4, "PRJ_VOL_MAT_%s", "m³", "Fourniture et mise en oeuvre de %s", VEL_ROAD_ALL "Volume total du matériau %s.", kStructure, "GC", F, Range::Single, {}},
    {44, 4, "PRJ_TON_MAT_%s", "tonne", "%s en tonnes", VEL_ROAD_LINEAR "Masse totale du matériau %s en tonnes.", kStructure, "GC", F, Range::Single, {}},
    {45, 3, "PRJ_SFC_MAT_%s", "m²", "Fourniture et mise en oeuvre de %s", VEL_ROAD_LINEAR "Surface 3D totale du matériau %s.", R"(Voirie\\Surface de matériaux (enduits, pavés...))", "GC", F, Range::Single, {}},
    {46, 2, "PRJ_LIN_MAT_%s", "ml", "Fourniture et mise en oeuvre de %s", VEL_ROAD_LINEAR "Longueur 3D totale du matériau %s.", R"(Voirie\\Bordures, caniveaux...)", "GC", F, Range::Single, {}},
    {47, 3, "PRJ_SFC_RAB_%.2f_%.2f_3D", "m²", "Surface 3D de rabotage d'épaisseur entre %.2f m et %.2f m", VEL_ROAD_KORVANE "Surface 3D totale de rabotage d'épaisseur comprise entre %.2f m et %.2f m.", kExistingRoads, "GC", F, Range::Single, {}},
    {48, 3, "PRJ_SFC_RAB_%.2f_3D", "m²", "Surface 3D de rabotage d'épaisseur > à %.2f m", VEL_ROAD_KORVANE "Surface 3D totale de rabotage d'épaisseur > à %.2f m.", kExistingRoads, "GC", F, Range::Single, {}},
    {49, 4, "PRJ_VOL_RPF_%s", "m³", "Volume de reprofilage de %s", VEL_ROAD_KORVANE "Volume de reprofilage utilisé pour le matériau %s", kExistingRoads, "GC", F, Range::Single, {}},
    {50, 2, "PRJ_SCI_LIN_3D", "ml", "Sciage de chaussée", VEL_ROAD_KORVANE "Longueur 3D totale de découpe de chaussée par sciage.", kExistingRoads, "GC", F, Range::Single, {}},
};
// clang-format on

#undef VEL_ROAD_ALL
#undef VEL_ROAD_LINEAR
#undef VEL_ROAD_KORVANE

// True when index is listed in "a,b-c,..." form.
bool ListsIndex(std::string_view list, int index)
{
    while (!list.empty()) {
        const auto comma = list.find(',');
        const std::string_view item = list.substr(0, comma);
        list = comma == std::string_view::npos ? std::string_view() : list.substr(comma + 1);
        const auto dash = item.find('-');
        const int first = std::stoi(std::string(item.substr(0, dash)));
        const int last = dash == std::string_view::npos ? first : std::stoi(std::string(item.substr(dash + 1)));
        if (index >= first && index <= last)
            return true;
    }
    return false;
}

bool InRange(Range range, int index)
{
    switch (range) {
    case Range::EpEu:
        return index <= 1;
    case Range::From2:
        return index >= 2;
    default:
        return true;
    }
}

const char* CategoryOf(const Row& row, int index)
{
    switch (row.family) {
    case Family::Pipe:
        return kNetworks[index].pipe;
    case Family::Fitting:
        return kNetworks[index].fitting;
    case Family::Supply:
        return kNetworks[index].supply;
    default:
        return row.category;
    }
}

void AddNetworkTexts(CZodEVIArtTemplate& work, const Row& row, int index)
{
    const char* designation = row.designation;
    const char* description = row.description;
    for (const Variant& variant : row.variants) {
        if (ListsIndex(variant.indexes, index)) {
            designation = variant.designation;
            description = variant.description;
        }
    }
    const char* prefix = row.prefix != nullptr ? row.prefix : kNetworks[index].prefix;
    work.SetTexts(index, designation, NetworkSentence(index) + description, CategoryOf(row, index), prefix);
}

} // namespace

const char* NetworkNumberingPrefix(int networkIndex)
{
    if (networkIndex < 0 || networkIndex >= kNetworkIndexCount)
        return "";
    return kNetworks[networkIndex].prefix;
}

void FillStandardCatalogue(CZodEVIArtTemplateArray& catalogue)
{
    CZodEVIArtTemplate work;
    for (const Row& row : kCatalogue) {
        const bool uniform = row.family == Family::Fixed && row.variants.size() == 0;
        if (row.range == Range::Single) {
            work.SetSingle(row.kind, row.nature, row.code, row.unit, row.designation, row.description, row.category,
                           row.prefix);
        } else if (row.range == Range::All && uniform) {
            work.SetPerNetwork(row.kind, row.nature, row.code, row.unit, row.designation, row.description, row.category,
                               row.prefix);
        } else {
            // Only the indexes of the range get texts: the others stay absent, so the
            // template never applies to those networks.
            if (row.range == Range::All) {
                work.SetPerNetworkEmpty(row.kind, row.nature, row.code, row.unit);
            } else {
                work.Reset();
                work.kind = row.kind;
                work.nature = row.nature;
                work.codePattern = row.code;
                work.unit = row.unit;
            }
            for (int index = 0; index < kNetworkIndexCount; ++index)
                if (InRange(row.range, index))
                    AddNetworkTexts(work, row, index);
        }
        catalogue.InsertCopyAt(catalogue.GetSize(), work);
    }
}

} // namespace zodevi

// Reading, writing and editing the schedule through the metre module, and the price
// queries by quantity selector.
#include "schedule/schedule_exchange.hpp"

#include "common/parameters.hpp"
#include "schedule/metre_link.hpp"
#include "text/text.hpp"
#include "velhost/editor.h"
#include "velhost/files.h"
#include "velhost/ui.h"

#include <algorithm>
#include <filesystem>
#include <memory>

namespace zodevi {

namespace {

constexpr const char* kNoArticleMessage = "ERREUR : aucun article ne se réfère à l'élément !";

const char* const kSelectorPatterns[] = {
    "RSX_TUY_LIN_3D_%s", "RSX_TUY_NB_%s",  "RSX_FRX_LIN_3D_%s",      "RSX_FRX_NB_%s",      "RSX_PGN_LIN_3D_%s",
    "RSX_PGN_NB_%s",     "RSX_SBL_NB_%s",  "RSX_TUY_FRNT_LIN_3D_%s", "RSX_SBL_FRNT_NB_%s", "PRJ_VOL_MAT_%s",
    "PRJ_SFC_MAT_%s",    "PRJ_LIN_MAT_%s", "PRJ_TON_MAT_%s",
};

std::string QuantityKeyOf(int selector, const std::string& item)
{
    return MakeQuantityKey(FormatPattern(QuantityPatternOfSelector(selector), {item}));
}

std::string NetworkKeyOrGeneral(const std::string& networkName)
{
    return MakeNetworkGroupKey(networkName.empty() ? std::string(kGeneralNetworkName) : networkName);
}

std::string GroupKeyOf(int selector, const std::string& networkName)
{
    if (selector >= 0 && selector <= 8)
        return NetworkKeyOrGeneral(networkName);
    if (selector >= 9 && selector <= 12)
        return MakeRoadGroupKey();
    return {};
}

CZodEVIArticle* FindQuantityArticle(const CZodEVIBdr& bdr, int selector, const std::string& item,
                                    const std::string& networkName)
{
    const CZodEVIGroup* group = bdr.Groups().Find(GroupKeyOf(selector, networkName));
    return group == nullptr ? nullptr : bdr.FindInGroupByQuantityKey(QuantityKeyOf(selector, item), group).article;
}

// Owns what the metre module returned, whatever happens to it.
struct ReturnedArticles {
    std::vector<CZodEVIArticle*> list;
    ~ReturnedArticles()
    {
        for (CZodEVIArticle* article : list)
            delete article;
    }
};

// A modified article whose group key changed leaves its old group for the new key's,
// so that every article stays in the group of its own key.
void ApplyModification(CZodEVIBdr& bdr, const CZodEVIArticle& returned)
{
    if (CZodEVIArticle* stored = bdr.FindByTreePath(returned.treePath).article)
        bdr.ReplaceArticle(*stored, returned);
}

// Applies the editor's changes; true when an added article took a neighbour's group key.
bool ApplyChanges(CZodEVIBdr& bdr, const std::vector<CZodEVIArticle*>& records,
                  const std::vector<std::uint32_t>& actions)
{
    bool regrouped = false;
    const std::size_t count = std::min(records.size(), actions.size());
    for (std::size_t i = 0; i < count; ++i) {
        const CZodEVIArticle* article = records[i];
        if (article == nullptr)
            continue;
        switch (actions[i]) {
        case kEditDeleted:
            bdr.RemoveByTreePath(article->treePath);
            break;
        case kEditModified:
            ApplyModification(bdr, *article);
            break;
        case kEditAdded:
            regrouped = bdr.AddEditedArticle(*article) || regrouped;
            break;
        default:
            break;
        }
    }
    return regrouped;
}

std::int32_t CallEditor(const CZodEVIBdr& bdr, const std::string& treePath, ReturnedArticles& records,
                        std::vector<std::uint32_t>& actions)
{
    return BdrMetre().EditSchedule(bdr.path, treePath, records.list, actions);
}

bool Export(CZodEVIBdr& bdr)
{
    std::vector<CZodEVIArticle*> list;
    list.reserve(bdr.Articles().size());
    for (const auto& article : bdr.Articles())
        list.push_back(article.get());
    return BdrMetre().ExportTable(bdr.path, list) == 0;
}

bool SameFile(const std::string& a, const std::string& b)
{
    if (a == b)
        return true;
    std::error_code error;
    return std::filesystem::equivalent(a, b, error);
}

// Why an existing file did not read, as far as this side can tell; the metre module has
// printed the details (line, element) when it refused the content.
std::string NotReadReason(const VelFileIdentity& file)
{
    if (!file.readable)
        return "fichier illisible : droits ou disque";
    if (file.size == 0)
        return "fichier vide";
    return "contenu refusé par le module de métré : fichier tronqué, mal formé ou champ inconnu";
}

void NoteFailedRead(CZodEVIBdr& bdr, const std::string& path, const VelFileIdentity& before)
{
    CZodEVIBdrFileState& state = bdr.fileState;
    state.path = path;
    state.known = true;
    state.identity = before;
    // A missing file is no loss: the first write creates it.
    state.notRead = before.exists;
    state.notReadReason = before.exists ? NotReadReason(before) : std::string();
}

void PrintNotRead(const CZodEVIBdr& bdr)
{
    const std::string& path = bdr.fileState.path;
    acutPrintf("\nERREUR : le bordereau « %s » n'a pas pu être lu (%s) ; il n'est ni ouvert ni enregistré tant "
               "qu'il ne se lit pas, pour ne pas perdre les prix qu'il contient. Réparez-le ou remettez sa copie "
               "« %s.bak », ou choisissez un autre bordereau ; les changements faits depuis restent en mémoire.\n",
               path.c_str(), bdr.fileState.notReadReason.c_str(), path.c_str());
}

// The metre module's articles of a file. `before` is the identity of the version it
// read: the host tells it, having hashed the bytes the module read; a version written
// meanwhile is then seen as a change at the next write. For a reader that does not read
// through the host, the file as it is after the reading stands for it, or, when it
// changed during the reading, an identity that matches no version.
bool ReadArticles(const std::string& path, ReturnedArticles& delivered, VelFileIdentity& before)
{
    const std::uint64_t mark = velFileReadMark();
    const VelFileStamp stamp = velFileStamp(path);
    const bool read = BdrMetre().FillTable(path, delivered.list) == 0;
    if (velFileReadSince(mark, path, before))
        return read;
    before = velFileIdentity(path);
    if (read && before.exists && velFileStamp(path) != stamp)
        before.readable = false;
    return read;
}

void AddProjectWideArticles(CZodEVIBdr& bdr);

// Replaces the content of the schedule with what was read; the changes made in memory
// are forgotten, the file now being their reference.
void Fill(CZodEVIBdr& bdr, const std::string& path, ReturnedArticles& delivered, const VelFileIdentity& before)
{
    bdr.Clear();
    bdr.path = path;
    CZodEVIGroup* group = nullptr;
    const std::string* groupKey = nullptr;
    for (CZodEVIArticle*& raw : delivered.list) {
        if (raw == nullptr)
            continue;
        CZodEVIArticle* article = bdr.AddArticle(std::unique_ptr<CZodEVIArticle>(raw));
        raw = nullptr;
        // Files keep a group's articles together: the previous article's group is usually
        // the one.
        if (groupKey == nullptr || *groupKey != article->groupKey)
            group = bdr.GroupOf(article->groupKey, true);
        groupKey = &article->groupKey;
        group->push_back(article);
    }
    AddProjectWideArticles(bdr);
    bdr.fileState = CZodEVIBdrFileState{path, true, before, false, {}, {}};
}

// Reads the file again and makes the changes of memory on it; on failure the schedule
// keeps its content and its changes.
bool Reload(CZodEVIBdr& bdr)
{
    ReturnedArticles delivered;
    VelFileIdentity before;
    if (!ReadArticles(bdr.path, delivered, before)) {
        NoteFailedRead(bdr, bdr.path, before);
        return false;
    }
    auto pending = std::move(bdr.fileState.pending);
    Fill(bdr, bdr.path, delivered, before);
    for (const auto& change : pending)
        change(bdr);
    bdr.fileState.pending = std::move(pending);
    return true;
}

// A schedule whose file did not read tries once more, so that a repaired file is taken
// up; false, with the message, while it still does not read.
bool FileReadable(CZodEVIBdr& bdr)
{
    // A file that went away meanwhile is no longer in danger: the next write creates one.
    if (!bdr.fileState.notRead || !SameFile(bdr.fileState.path, bdr.path) || Reload(bdr) || !bdr.fileState.notRead)
        return true;
    PrintNotRead(bdr);
    return false;
}

// True when the file is the version the schedule read or wrote last (or is missing, for
// a schedule that never met it).
bool FileUnchanged(const CZodEVIBdr& bdr, const VelFileIdentity& now)
{
    const CZodEVIBdrFileState& state = bdr.fileState;
    if (!state.known || !SameFile(state.path, bdr.path))
        return !now.exists;
    return state.identity.sameContent(now);
}

// The file as it is now becomes the version the schedule stands on.
void AdoptFile(CZodEVIBdr& bdr)
{
    CZodEVIBdrFileState& state = bdr.fileState;
    state.path = bdr.path;
    state.known = true;
    state.identity = velFileIdentity(bdr.path);
    state.notRead = false;
    state.notReadReason.clear();
}

void AddProjectWideArticles(CZodEVIBdr& bdr)
{
    const std::string roadKey = MakeRoadGroupKey();
    CZodEVIGroup* road = bdr.GroupOf(roadKey, true);
    const bool roadWasEmpty = road->empty();
    for (int kind : {1, 41, 42, 50}) {
        CZodEVIArtTemplateArray selection;
        selection.SetOwning(false);
        bdr.Catalogue().SelectKind(kind, selection);
        for (int i = 0; i < selection.GetSize(); ++i) {
            const CZodEVIArtTemplate* tmpl = selection[i];
            if (tmpl == nullptr)
                continue;
            const std::string quantityKey = MakeQuantityKey(tmpl->codePattern);
            if (kind == 1 ? !roadWasEmpty : static_cast<bool>(bdr.FindInGroupByQuantityKey(quantityKey, road)))
                continue;
            const CZodEVIArtParam* texts = tmpl->FirstTexts();
            if (texts == nullptr)
                continue;
            auto article = std::make_unique<CZodEVIArticle>();
            article->code = bdr.NewCode(texts->numberingPrefix, road);
            article->number = bdr.TakeNextNumber();
            article->nature = tmpl->nature;
            article->designation = texts->designation;
            article->description = texts->description;
            article->unit = tmpl->unit;
            article->quantityKey = quantityKey;
            article->groupKey = roadKey;
            article->metreInt4 = 0;
            article->treePath = MakeTreePath(MakeCategory(*texts, tmpl->nature), article->code, article->designation);
            road->push_back(bdr.AddArticle(std::move(article)));
        }
    }
}

} // namespace

std::string QuantityPatternOfSelector(int selector)
{
    if (selector < 0 || selector >= static_cast<int>(std::size(kSelectorPatterns)))
        return {};
    return kSelectorPatterns[selector];
}

bool Read(CZodEVIBdr& bdr)
{
    bdr.Clear();
    bdr.fileState.pending.clear();
    ReturnedArticles delivered;
    VelFileIdentity before;
    if (!ReadArticles(bdr.path, delivered, before)) {
        NoteFailedRead(bdr, bdr.path, before);
        return false;
    }
    Fill(bdr, bdr.path, delivered, before);
    return true;
}

bool ReadFrom(CZodEVIBdr& bdr, const std::string& path)
{
    ReturnedArticles delivered;
    VelFileIdentity before;
    if (!ReadArticles(path, delivered, before)) {
        if (SameFile(path, bdr.path))
            NoteFailedRead(bdr, path, before);
        return false;
    }
    Fill(bdr, path, delivered, before);
    return true;
}

void RecordPendingChange(CZodEVIBdr& bdr, std::function<void(CZodEVIBdr&)> change)
{
    bdr.fileState.pending.push_back(std::move(change));
}

bool Write(CZodEVIBdr& bdr)
{
    // No file to compare with nor to lock: the metre module says why nothing is written.
    if (bdr.path.empty())
        return Export(bdr);
    for (;;) {
        if (!FileReadable(bdr))
            return false;
        VelFileIdentity now;
        {
            // Compared and replaced under the lock: another host cannot slip its version
            // in between.
            const VelFileLock lock(bdr.path);
            if (!lock.locked()) {
                acutPrintf("\n%s\n", lock.result().message.c_str());
                return false;
            }
            now = velFileIdentity(bdr.path);
            if (FileUnchanged(bdr, now)) {
                if (!Export(bdr))
                    return false;
                AdoptFile(bdr);
                bdr.fileState.pending.clear();
                return true;
            }
        }
        const bool neverRead = !bdr.fileState.known || !SameFile(bdr.fileState.path, bdr.path);
        if (velUI().isScripted()) {
            if (neverRead)
                acutPrintf("\nERREUR : le bordereau « %s » existe mais n'a pas été lu ; il n'est pas remplacé. "
                           "Lisez-le, puis recommencez.\n",
                           bdr.path.c_str());
            else
                acutPrintf("\nERREUR : le bordereau « %s » a été modifié par un autre utilisateur ou programme "
                           "depuis sa lecture ; il n'est pas remplacé, pour ne pas perdre ses modifications. "
                           "Relisez-le, puis recommencez.\n",
                           bdr.path.c_str());
            return false;
        }
        acutPrintf(neverRead ? "\nLe bordereau « %s » existe mais n'a pas été lu."
                             : "\nLe bordereau « %s » a été modifié par un autre utilisateur ou programme depuis "
                               "sa lecture.",
                   bdr.path.c_str());
        bool reload = true;
        if (!AskYesNo("Le relire et y reporter les changements faits ici (Non : le remplacer par la version en "
                      "mémoire)",
                      true, true, reload))
            return false;
        if (reload) {
            if (!Reload(bdr)) {
                if (bdr.fileState.notRead)
                    PrintNotRead(bdr);
                else
                    acutPrintf("\nERREUR : le bordereau « %s » n'existe plus ; rien n'est enregistré. Le prochain "
                               "enregistrement le recréera avec la version en mémoire.\n",
                               bdr.path.c_str());
                return false;
            }
        } else {
            bdr.fileState.path = bdr.path;
            bdr.fileState.known = true;
            bdr.fileState.identity = now;
        }
    }
}

bool Edit(CZodEVIBdr& bdr, const std::string& treePath)
{
    if (!FileReadable(bdr))
        return false;
    // The editor works on the file; when that is the version of memory, the file it
    // leaves becomes that version too.
    const bool upToDate = FileUnchanged(bdr, velFileIdentity(bdr.path));
    ReturnedArticles records;
    std::vector<std::uint32_t> actions;
    if (CallEditor(bdr, treePath, records, actions) != 0)
        return false;
    if (upToDate)
        AdoptFile(bdr);
    if (ApplyChanges(bdr, records.list, actions))
        return Write(bdr);
    return true;
}

bool GetPrice(const CZodEVIBdr& bdr, int selector, const std::string& item, double& price,
              const std::string& networkName)
{
    price = 0;
    const CZodEVIArticle* article = FindQuantityArticle(bdr, selector, item, networkName);
    if (article == nullptr)
        return false;
    price = article->unitPrice;
    return true;
}

bool GetPricesPerNetwork(const CZodEVIBdr& bdr, int selector, const std::string& item,
                         std::map<std::string, std::string>& prices)
{
    prices.clear();
    const std::string quantityKey = QuantityKeyOf(selector, item);
    const std::string generalKey = MakeNetworkGroupKey(kGeneralNetworkName);
    for (const auto& [key, group] : bdr.Groups()) {
        std::string name;
        if (EqualsNoCase(key, generalKey)) {
            name.assign(1, '*');
        } else {
            if (bdr.NetworkIndexOf(key) == nullptr)
                continue;
            const std::optional<std::string> network = NetworkNameOfKey(key);
            if (!network)
                continue;
            name = *network;
        }
        if (const CZodEVIArticle* article = bdr.FindInGroupByQuantityKey(quantityKey, group.get()).article)
            prices[name] = FormatRealShortest(article->unitPrice);
    }
    return !prices.empty();
}

bool SetPrice(CZodEVIBdr& bdr, int selector, const std::string& item, double price, const std::string& networkName)
{
    CZodEVIArticle* article = FindQuantityArticle(bdr, selector, item, networkName);
    if (article == nullptr)
        return false;
    article->unitPrice = price;
    return true;
}

bool ShowPrice(CZodEVIBdr& bdr, int selector, const std::string& item, const std::string& networkName)
{
    if (!FileReadable(bdr))
        return false;
    const std::string quantityKey = QuantityKeyOf(selector, item);
    std::vector<const CZodEVIGroup*> searched;
    if (selector == 0 || selector == 1 || selector == 6) {
        searched.push_back(bdr.Groups().Find(NetworkKeyOrGeneral(networkName)));
    } else if (selector >= 2 && selector <= 8) {
        if (!networkName.empty())
            searched.push_back(bdr.Groups().Find(MakeNetworkGroupKey(networkName)));
        else
            for (const auto& entry : bdr.Groups())
                searched.push_back(entry.second.get());
    } else if (selector >= 9 && selector <= 12) {
        searched.push_back(bdr.Groups().Find(MakeRoadGroupKey()));
    }
    const CZodEVIArticle* found = nullptr;
    for (const CZodEVIGroup* group : searched)
        if (group != nullptr && (found = bdr.FindInGroupByQuantityKey(quantityKey, group).article) != nullptr)
            break;
    ReturnedArticles records;
    std::vector<std::uint32_t> actions;
    bool shown = false;
    if (found != nullptr) {
        const std::string treePath = found->treePath;
        const bool upToDate = FileUnchanged(bdr, velFileIdentity(bdr.path));
        shown = CallEditor(bdr, treePath, records, actions) == 0;
        if (shown && upToDate)
            AdoptFile(bdr);
    } else {
        MessageBoxFlags(nullptr, MB_OK | MB_ICONWARNING, "%s", kNoArticleMessage);
    }
    if (ApplyChanges(bdr, records.list, actions))
        Write(bdr);
    return shown;
}

} // namespace zodevi

// The editing session of the schedule and the text table of the terminal editor.
#include "schedule_edit.hpp"

#include "text/text.hpp"

#include <array>
#include <cmath>
#include <cstring>

namespace metre {

namespace {

constexpr std::string_view kSeparator = "\\\\";

const char* const kNatureLevels[] = {"Ponctuel", "Linéaire", "Surfacique", "Volumique", "Textuel", "Non Graphique"};

std::string NatureLevel(int nature)
{
    if (nature < 1 || nature > 6)
        return {};
    return std::string(kSeparator) + kNatureLevels[nature - 1];
}

bool SameValue(const CZodEVIArticle& a, const CZodEVIArticle& b, const CZodEVIArticleField& field)
{
    switch (field.type) {
    case CZodEVIArticleField::Type::Text:
        return a.*field.text == b.*field.text;
    case CZodEVIArticleField::Type::Int:
        return a.*field.integer == b.*field.integer;
    case CZodEVIArticleField::Type::Real: {
        const double x = a.*field.real, y = b.*field.real;
        return (x == y && std::signbit(x) == std::signbit(y)) || (std::isnan(x) && std::isnan(y));
    }
    }
    return false;
}

bool SameArticle(const CZodEVIArticle& a, const CZodEVIArticle& b)
{
    for (const CZodEVIArticleField& field : ArticleFields())
        if (!SameValue(a, b, field))
            return false;
    return true;
}

// The tree path with a new code, designation or nature, the category kept.
std::string RebuiltTreePath(const CZodEVIArticle& article, int previousNature)
{
    std::string category;
    const std::size_t last = article.treePath.rfind('\\');
    if (last != std::string::npos && last > 0)
        category = article.treePath.substr(0, last - 1);
    const std::string oldLevel = NatureLevel(previousNature);
    if (!oldLevel.empty() && category.size() >= oldLevel.size() &&
        category.compare(category.size() - oldLevel.size(), oldLevel.size(), oldLevel) == 0)
        category = category.substr(0, category.size() - oldLevel.size()) + NatureLevel(article.nature);
    const std::string leaf = article.code + " - " + article.designation;
    return category.empty() ? leaf : category + std::string(kSeparator) + leaf;
}

} // namespace

const CZodEVIArticleField* FieldNamed(std::string_view name)
{
    for (const CZodEVIArticleField& field : ArticleFields())
        if (name == field.name)
            return &field;
    return nullptr;
}

ScheduleEdit::ScheduleEdit(const ArticleVector& original) : original_(original)
{
    entries_.reserve(original.size());
    for (std::size_t i = 0; i < original.size(); ++i)
        entries_.push_back({i, *original[i], false});
}

ScheduleEdit::Entry* ScheduleEdit::Find(const std::string& treePath)
{
    for (Entry& entry : entries_)
        if (EqualsNoCase(entry.article.treePath, treePath))
            return &entry;
    return nullptr;
}

bool ScheduleEdit::SetEntryField(Entry& entry, const CZodEVIArticleField& field, const std::string& value)
{
    CZodEVIArticle& article = entry.article;
    const int previousNature = article.nature;
    if (!SetFieldText(article, field, value))
        return false;
    if (field.text == &CZodEVIArticle::treePath)
        entry.treePathSet = true;
    else if (!entry.treePathSet && (field.text == &CZodEVIArticle::code || field.text == &CZodEVIArticle::designation ||
                                    field.integer == &CZodEVIArticle::nature))
        article.treePath = RebuiltTreePath(article, previousNature);
    return true;
}

bool ScheduleEdit::Delete(const std::string& treePath, std::string& error)
{
    for (auto it = entries_.begin(); it != entries_.end(); ++it)
        if (EqualsNoCase(it->article.treePath, treePath)) {
            entries_.erase(it);
            return true;
        }
    error = FormatString("aucun article « %s »", treePath.c_str());
    return false;
}

bool ScheduleEdit::SetField(const std::string& treePath, const std::string& field, const std::string& value,
                            std::string& error)
{
    const CZodEVIArticleField* description = FieldNamed(field);
    if (description == nullptr) {
        error = FormatString("champ inconnu « %s »", field.c_str());
        return false;
    }
    Entry* entry = Find(treePath);
    if (entry == nullptr) {
        error = FormatString("aucun article « %s »", treePath.c_str());
        return false;
    }
    if (!SetEntryField(*entry, *description, value)) {
        error = FormatString("champ « %s » : %s attendu, « %s » trouvé", field.c_str(),
                             description->type == CZodEVIArticleField::Type::Int ? "nombre entier" : "nombre",
                             value.c_str());
        return false;
    }
    return true;
}

void ScheduleEdit::FillFromTreePath(CZodEVIArticle& article, bool code, bool designation, bool nature)
{
    const std::string& treePath = article.treePath;
    const std::size_t last = treePath.rfind('\\');
    const std::string leaf = last == std::string::npos ? treePath : treePath.substr(last + 1);
    const std::size_t dash = leaf.find(" - ");
    if (code)
        article.code = dash == std::string::npos ? leaf : leaf.substr(0, dash);
    if (designation)
        article.designation = dash == std::string::npos ? leaf : leaf.substr(dash + 3);
    for (int level = 1; nature && level <= 6; ++level)
        if (treePath.find(NatureLevel(level) + std::string(kSeparator)) != std::string::npos)
            article.nature = level;
}

bool ScheduleEdit::Add(const std::string& treePath, std::string& error)
{
    if (TrimBlanks(treePath).empty()) {
        error = "chemin d'arborescence vide";
        return false;
    }
    if (Find(treePath) != nullptr) {
        error = FormatString("l'article « %s » existe déjà", treePath.c_str());
        return false;
    }
    Entry entry;
    entry.article.treePath = treePath;
    entry.article.metreInt4 = 0;
    entry.article.groupKey.assign(1, '0');
    entry.treePathSet = true;
    FillFromTreePath(entry.article, true, true, true);
    entries_.push_back(std::move(entry));
    return true;
}

bool ScheduleEdit::Validate(std::string& error) const
{
    for (std::size_t i = 0; i < entries_.size(); ++i) {
        const std::string& path = entries_[i].article.treePath;
        if (TrimBlanks(path).empty()) {
            error = FormatString("l'article « %s » n'a pas de chemin d'arborescence (treePath)",
                                 entries_[i].article.code.c_str());
            return false;
        }
        for (std::size_t j = i + 1; j < entries_.size(); ++j)
            if (EqualsNoCase(path, entries_[j].article.treePath)) {
                error = FormatString("deux articles ont le chemin « %s »", path.c_str());
                return false;
            }
    }
    return true;
}

std::vector<ScheduleChange> ScheduleEdit::Changes() const
{
    std::vector<bool> kept(original_.size(), false);
    std::vector<ScheduleChange> deleted, modified, added;
    const auto copy = [](const CZodEVIArticle& a) { return std::make_unique<CZodEVIArticle>(a); };
    for (const Entry& entry : entries_) {
        if (!entry.original) {
            added.push_back({kEditAdded, copy(entry.article)});
            continue;
        }
        kept[*entry.original] = true;
        const CZodEVIArticle& before = *original_[*entry.original];
        if (SameArticle(before, entry.article))
            continue;
        if (EqualsNoCase(before.treePath, entry.article.treePath)) {
            modified.push_back({kEditModified, copy(entry.article)});
        } else {
            deleted.push_back({kEditDeleted, copy(before)});
            added.push_back({kEditAdded, copy(entry.article)});
        }
    }
    std::vector<ScheduleChange> changes;
    for (std::size_t i = 0; i < original_.size(); ++i)
        if (!kept[i])
            changes.push_back({kEditDeleted, copy(*original_[i])});
    for (auto* list : {&deleted, &modified, &added})
        for (ScheduleChange& change : *list)
            changes.push_back(std::move(change));
    return changes;
}

std::vector<const CZodEVIArticle*> ScheduleEdit::Result() const
{
    std::vector<const CZodEVIArticle*> byOriginal(original_.size(), nullptr);
    std::vector<const CZodEVIArticle*> added;
    for (const Entry& entry : entries_) {
        if (entry.original)
            byOriginal[*entry.original] = &entry.article;
        else
            added.push_back(&entry.article);
    }
    std::vector<const CZodEVIArticle*> result;
    for (const CZodEVIArticle* article : byOriginal)
        if (article != nullptr)
            result.push_back(article);
    result.insert(result.end(), added.begin(), added.end());
    return result;
}

std::string EncodeTableValue(std::string_view value)
{
    std::string out;
    out.reserve(value.size());
    for (char c : value) {
        if (c == '\n')
            out += "\\n";
        else if (c == '\r')
            out += "\\r";
        else if (c == '\t')
            out += "\\t";
        else
            out += c;
    }
    return out;
}

std::string DecodeTableValue(std::string_view text)
{
    std::string out;
    out.reserve(text.size());
    for (std::size_t i = 0; i < text.size(); ++i) {
        if (text[i] == '\\' && i + 1 < text.size()) {
            const char next = text[i + 1];
            if (next == '\\') {
                out += "\\\\";
                ++i;
                continue;
            }
            if (next == 'n' || next == 'r' || next == 't') {
                out += next == 'n' ? '\n' : next == 'r' ? '\r' : '\t';
                ++i;
                continue;
            }
        }
        out += text[i];
    }
    return out;
}

std::string ScheduleTable(const ArticleVector& articles, const std::string& path, const std::string& treePath,
                          int& line)
{
    std::string out =
        FormatString("# Bordereau des prix : %s\n"
                     "# Un bloc par article, un champ par ligne (« nom = valeur »). Supprimer un bloc supprime\n"
                     "# l'article ; un bloc qui commence par [nouveau] ajoute un article (treePath exigé).\n"
                     "# Dans les valeurs, \\n, \\r et \\t sont le saut de ligne, le retour chariot et la tabulation.\n"
                     "# Enregistrer et quitter valide le tableau ; quitter sans enregistrer n'y change rien.\n",
                     path.c_str());
    int current = 6;
    line = 1;
    const auto& fields = ArticleFields();
    for (std::size_t i = 0; i < articles.size(); ++i) {
        out += FormatString("\n[article %zu]\n", i + 1);
        current += 1;
        if (!treePath.empty() && line == 1 && EqualsNoCase(articles[i]->treePath, treePath))
            line = current;
        for (const CZodEVIArticleField& field : fields)
            out += FormatString("%s = %s\n", field.name, EncodeTableValue(FieldText(*articles[i], field)).c_str());
        current += static_cast<int>(fields.size()) + 1;
    }
    return out;
}

bool ParseScheduleTable(std::string_view text, const std::string& name, ScheduleEdit& edit, std::string& error,
                        int& errorLine)
{
    const auto fail = [&](int line, const std::string& what) {
        error = FormatString("Tableau « %s », ligne %d : %s.", name.c_str(), line, what.c_str());
        errorLine = line;
        return false;
    };
    auto& entries = edit.Entries();
    const ArticleVector& original = edit.Original();
    entries.clear();
    std::vector<bool> seen(original.size(), false);
    ScheduleEdit::Entry* block = nullptr;
    std::vector<int> newBlockLines;
    // Which of code, designation and nature each new block gives itself.
    std::vector<std::array<bool, 3>> newBlockGiven;
    int lineNumber = 0;
    std::size_t start = 0;
    while (start < text.size()) {
        std::size_t end = text.find('\n', start);
        if (end == std::string_view::npos)
            end = text.size();
        std::string_view line = text.substr(start, end - start);
        start = end + 1;
        ++lineNumber;
        if (!line.empty() && line.back() == '\r')
            line.remove_suffix(1);
        const std::string trimmed = TrimBlanks(line);
        if (trimmed.empty() || trimmed[0] == '#')
            continue;
        if (trimmed[0] == '[') {
            if (trimmed == "[nouveau]") {
                entries.push_back({std::nullopt, CZodEVIArticle(), false});
                entries.back().article.metreInt4 = 0;
                entries.back().article.groupKey.assign(1, '0');
                newBlockLines.push_back(lineNumber);
                newBlockGiven.push_back({false, false, false});
            } else {
                unsigned long number = 0;
                char tail = 0;
                if (std::sscanf(trimmed.c_str(), "[article %lu%c", &number, &tail) != 2 || tail != ']' ||
                    trimmed.back() != ']' || number == 0 || number > original.size())
                    return fail(lineNumber, FormatString("en-tête « [article N] » (N de 1 à %zu) ou « [nouveau] » "
                                                         "attendu, « %s » trouvé",
                                                         original.size(), trimmed.c_str()));
                if (seen[number - 1])
                    return fail(lineNumber, FormatString("l'article %lu figure deux fois", number));
                seen[number - 1] = true;
                entries.push_back({number - 1, *original[number - 1], false});
            }
            block = &entries.back();
            continue;
        }
        if (block == nullptr)
            return fail(lineNumber, "en-tête de bloc « [article N] » attendu avant les champs");
        const std::size_t equals = line.find('=');
        if (equals == std::string_view::npos)
            return fail(lineNumber, FormatString("« nom = valeur » attendu, « %s » trouvé", trimmed.c_str()));
        const std::string fieldName = TrimBlanks(line.substr(0, equals));
        const CZodEVIArticleField* field = FieldNamed(fieldName);
        if (field == nullptr)
            return fail(lineNumber, FormatString("champ inconnu « %s »", fieldName.c_str()));
        if (!block->original) {
            auto& given = newBlockGiven.back();
            given[0] = given[0] || field->text == &CZodEVIArticle::code;
            given[1] = given[1] || field->text == &CZodEVIArticle::designation;
            given[2] = given[2] || field->integer == &CZodEVIArticle::nature;
        }
        std::string_view value = line.substr(equals + 1);
        if (!value.empty() && value.front() == ' ')
            value.remove_prefix(1);
        // A value shown and left as it was keeps the exact stored value, whatever it holds.
        if (block->original && value == EncodeTableValue(FieldText(*original[*block->original], *field)))
            continue;
        if (!ScheduleEdit::SetEntryField(*block, *field, DecodeTableValue(value)))
            return fail(lineNumber,
                        FormatString("champ « %s » : %s attendu, « %s » trouvé", fieldName.c_str(),
                                     field->type == CZodEVIArticleField::Type::Int ? "nombre entier" : "nombre",
                                     std::string(value).c_str()));
    }
    std::size_t newIndex = 0;
    for (ScheduleEdit::Entry& entry : entries) {
        if (entry.original)
            continue;
        const int line = newBlockLines[newIndex];
        const auto& given = newBlockGiven[newIndex++];
        if (!entry.treePathSet)
            return fail(line, "un nouvel article demande le champ treePath");
        ScheduleEdit::FillFromTreePath(entry.article, !given[0], !given[1], !given[2]);
    }
    std::string problem;
    if (!edit.Validate(problem))
        return fail(lineNumber, problem);
    return true;
}

} // namespace metre

// One editing session of the schedule: the articles as opened, the user's deletions,
// field changes and additions, their validation, and the change list handed back to
// the caller (the contract's change kinds). Also the text table that the
// terminal editor shows and reads back.
#pragma once

#include "schedule_file.hpp"
#include "velsiblings/metre_services.h"

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace metre {

struct ScheduleChange {
    std::uint32_t kind = 0;
    std::unique_ptr<CZodEVIArticle> article;
};

class ScheduleEdit {
public:
    explicit ScheduleEdit(const ArticleVector& original);

    // Each answers false with a French message (without place: the caller names it).
    bool Delete(const std::string& treePath, std::string& error);
    // Sets a field of the article with that tree path from its text. Changing the code,
    // the designation or the nature rebuilds the tree path unless it was set itself.
    bool SetField(const std::string& treePath, const std::string& field, const std::string& value, std::string& error);
    // A new article filed under the tree path; its code, designation and nature are
    // taken from the path ("...\\Linéaire\\GC-004 - Bordure").
    bool Add(const std::string& treePath, std::string& error);
    // Every tree path present and unique (without regard to case).
    bool Validate(std::string& error) const;

    // Deletions, then modifications, then additions. A change of tree path is a deletion
    // of the old article and an addition of the new one, because the caller matches
    // modifications by tree path.
    std::vector<ScheduleChange> Changes() const;
    // The schedule after the session: originals in place, additions at the end.
    std::vector<const CZodEVIArticle*> Result() const;

    // Table text access.
    struct Entry {
        std::optional<std::size_t> original;
        CZodEVIArticle article;
        bool treePathSet = false;
    };
    std::vector<Entry>& Entries() { return entries_; }
    const ArticleVector& Original() const { return original_; }
    Entry* Find(const std::string& treePath);
    // Code, designation and nature (each when asked) from the article's tree path.
    static void FillFromTreePath(CZodEVIArticle& article, bool code, bool designation, bool nature);
    // Sets one field of an entry from its text; false when the text is no value of it.
    static bool SetEntryField(Entry& entry, const CZodEVIArticleField& field, const std::string& value);

private:
    const ArticleVector& original_;
    std::vector<Entry> entries_;
};

// The field description of a name; null when the record has no such field.
const CZodEVIArticleField* FieldNamed(std::string_view name);

// Values in the table: line feed, carriage return and tab as \n, \r and \t; a pair of
// backslashes stands for itself, so tree paths read as they are.
std::string EncodeTableValue(std::string_view value);
std::string DecodeTableValue(std::string_view text);

// The table shown in the terminal editor; `line` receives the line of the article with
// that tree path (1 when none is asked or found).
std::string ScheduleTable(const ArticleVector& articles, const std::string& path, const std::string& treePath,
                          int& line);

// Reads an edited table into a new session; false with a French message naming the table,
// the line and what was expected, and `errorLine` the line to show again.
bool ParseScheduleTable(std::string_view text, const std::string& name, ScheduleEdit& edit, std::string& error,
                        int& errorLine);

} // namespace metre

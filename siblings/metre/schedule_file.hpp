// The metre module's price-schedule file: an XML document with one <article> element per
// article carrying all 48 fields as attributes by name, read all or nothing and written
// atomically beside a backup of the previous version.
#pragma once

#include "velhost/read_result.h"
#include "zodevi/article.h"

#include <memory>
#include <string>
#include <string_view>
#include <vector>

namespace metre {

// One field as text (reals in the shortest form that reads back equal), and back; the
// reading answers false, leaving the field alone, when the text is no value of its type.
std::string FieldText(const CZodEVIArticle& article, const CZodEVIArticleField& field);
bool SetFieldText(CZodEVIArticle& article, const CZodEVIArticleField& field, std::string_view text);

using ArticleVector = std::vector<std::unique_ptr<CZodEVIArticle>>;

// Root and article element names of the file.
inline constexpr const char* kScheduleRoot = "bordereau";
inline constexpr const char* kScheduleArticle = "article";

// Reads and writes answer a VelReadResult: on failure its status, the file, the line and
// what was expected there, with the French line the user sees (naming the file, the line
// when there is one, and the problem) as its message.

// Reads every article of the file into `out`, which is left untouched unless the whole
// file was read.
VelReadResult ReadScheduleFile(const std::string& path, ArticleVector& out);
// Same from text in memory; `name` stands for the file in messages.
VelReadResult ReadScheduleText(std::string_view text, const std::string& name, ArticleVector& out);

// The two readings behind ReadScheduleText, for the checks that compare them: the direct
// one takes only a file as this module writes it (false for any other, `out` untouched),
// the document one any XML, with the messages.
bool ReadScheduleDirectly(std::string_view text, ArticleVector& out);
VelReadResult ReadScheduleDocument(std::string_view text, const std::string& name, ArticleVector& out);

// The file's text for these articles, in their order.
std::string ScheduleToXml(const std::vector<const CZodEVIArticle*>& articles);

// Writes the articles to `path`: the text goes to a temporary file beside it, which is
// flushed to disk and then renamed over the target once a copy of the previous version
// is kept as "<path>.bak". On failure the target and its backup are as they were.
VelReadResult WriteScheduleFile(const std::string& path, const std::vector<const CZodEVIArticle*>& articles);

// Replaces `path` atomically with `content`, keeping the previous version as
// "<path>.bak" when keepBackup is set and the file existed.
VelReadResult WriteFileAtomically(const std::string& path, std::string_view content, bool keepBackup);

} // namespace metre

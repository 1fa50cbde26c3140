// Command-line output and input: acutPrintf, keyword and text prompts read through the
// user-interface back-end.
#include "velhost/editor.h"

#include <cstdarg>

#include "text/text.hpp"
#include "velhost/ui.h"

namespace {

struct PendingInit {
    int flags = 0;
    std::string keywords;
};

PendingInit& NextInit()
{
    static PendingInit init;
    return init;
}

std::vector<std::string> SplitWords(const std::string& text)
{
    std::vector<std::string> words;
    std::string word;
    for (char c : text) {
        if (c == ' ' || c == '\t' || c == ',') {
            if (!word.empty())
                words.push_back(word);
            word.clear();
        } else {
            word += c;
        }
    }
    if (!word.empty())
        words.push_back(word);
    return words;
}

// Length of the shortcut a keyword requires: its leading capitals (digits count too),
// at least one character.
std::size_t ShortcutLength(const std::string& keyword)
{
    std::size_t n = 0;
    while (n < keyword.size() && ((keyword[n] >= 'A' && keyword[n] <= 'Z') || (keyword[n] >= '0' && keyword[n] <= '9')))
        ++n;
    return n == 0 ? 1 : n;
}

bool Matches(const std::string& answer, const std::string& keyword)
{
    if (EqualsNoCase(answer, keyword))
        return true;
    const std::size_t chars = CharCount(answer);
    if (chars < ShortcutLength(keyword) || chars > CharCount(keyword))
        return false;
    return EqualsNoCase(answer, FirstChars(keyword, chars));
}

int Find(const std::string& answer, const std::vector<std::string>& keywords)
{
    for (std::size_t i = 0; i < keywords.size(); ++i)
        if (EqualsNoCase(answer, keywords[i]))
            return static_cast<int>(i);
    for (std::size_t i = 0; i < keywords.size(); ++i)
        if (Matches(answer, keywords[i]))
            return static_cast<int>(i);
    return -1;
}

} // namespace

int acutPrintf(const char* format, ...)
{
    if (format == nullptr)
        return 0;
    va_list args;
    va_start(args, format);
    const std::string text = FormatStringV(format, args);
    va_end(args);
    velUI().print(text);
    return static_cast<int>(text.size());
}

int acedInitGet(int flags, const char* keywordList)
{
    NextInit() = {flags, keywordList ? keywordList : ""};
    return RTNORM;
}

int acedGetKword(const char* prompt, std::string& result)
{
    const PendingInit init = NextInit();
    NextInit() = {};
    std::vector<std::string> locals = SplitWords(init.keywords);
    std::vector<std::string> globals;
    for (std::size_t i = 0; i < locals.size(); ++i) {
        if (locals[i] != "_")
            continue;
        globals.assign(locals.begin() + static_cast<std::ptrdiff_t>(i) + 1, locals.end());
        locals.resize(i);
        break;
    }
    // A list whose globals do not pair with its locals is taken as locals only.
    if (globals.size() != locals.size())
        globals = locals;

    std::string shown = prompt ? prompt : "";
    for (;;) {
        std::optional<VelInputLine> line = velUI().readLine(shown);
        if (!line)
            return RTCAN;
        const std::string answer = line->text;
        if (answer.empty()) {
            if (init.flags & RSG_NONULL) {
                acutPrintf("Une réponse est requise.\n");
                continue;
            }
            result.clear();
            return RTNONE;
        }
        int index = -1;
        if (answer.front() == '_' && answer.size() > 1)
            index = Find(answer.substr(1), globals);
        else
            index = Find(answer, locals);
        if (index >= 0) {
            result = globals[static_cast<std::size_t>(index)];
            return RTNORM;
        }
        if (locals.empty())
            acutPrintf("Aucun mot-clé n'est attendu ici.\n");
        else
            acutPrintf("Mot-clé attendu : %s.\n", JoinStrings(locals, ", ").c_str());
    }
}

int acedGetString(bool allowSpaces, const char* prompt, std::string& result)
{
    NextInit() = {};
    std::optional<VelInputLine> line = velUI().readLine(prompt ? prompt : "");
    if (!line)
        return RTCAN;
    result = line->text;
    if (!allowSpaces) {
        const auto space = result.find_first_of(" \t");
        if (space != std::string::npos)
            result.erase(space);
    }
    return RTNORM;
}

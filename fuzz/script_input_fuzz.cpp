// Fuzz target of scripts and keyword input: the input's first line is a keyword list (its
// first byte also chooses the flags), the rest a script whose lines answer keyword and
// text prompts until it ends. A keyword answer is always one of the keywords offered.
#include <algorithm>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <sstream>
#include <string>
#include <vector>

#include "velhost/editor.h"
#include "velhost/ui.h"

namespace {

[[noreturn]] void Fault(const std::string& what)
{
    std::fprintf(stderr, "%s\n", what.c_str());
    std::abort();
}

// The words of a keyword list: separated by blanks or commas.
std::vector<std::string> Words(const std::string& list)
{
    std::vector<std::string> words;
    std::string word;
    for (char c : list + " ") {
        if (c == ' ' || c == '\t' || c == ',') {
            if (!word.empty())
                words.push_back(word);
            word.clear();
        } else {
            word += c;
        }
    }
    return words;
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    std::string_view input(reinterpret_cast<const char*>(data), size);
    const std::size_t end = input.find('\n');
    // As a C string passes it: up to a zero byte.
    const std::string_view list = input.substr(0, end);
    const std::string keywords(list.substr(0, list.find('\0')));
    std::istringstream script(std::string(end == std::string_view::npos ? std::string_view() : input.substr(end + 1)));
    std::ostringstream out;
    VelScriptedUI ui(script, out, "fuzz.scr");
    VelUserInterface* previous = velSetUI(&ui);
    const int flags = keywords.empty() ? 0 : (keywords[0] & RSG_NONULL);
    const std::vector<std::string> words = Words(keywords);
    for (int prompt = 0; prompt < 1000 && !ui.inputEnded(); ++prompt) {
        std::string answer;
        if (prompt % 3 == 2) {
            // A line ends at its line feed, and the carriage returns before it go too.
            const bool whole = prompt % 2 == 0;
            if (acedGetString(whole, "Texte : ", answer) == RTNORM &&
                (answer.find('\n') != std::string::npos || (whole && !answer.empty() && answer.back() == '\r')))
                Fault("fin de ligne dans une réponse");
            continue;
        }
        acedInitGet(flags, keywords.c_str());
        const int status = acedGetKword("Choix : ", answer);
        if (status == RTNORM && std::find(words.begin(), words.end(), answer) == words.end())
            Fault("mot-clé rendu qui n'était pas proposé : " + answer);
        if (status == RTNONE && (flags & RSG_NONULL))
            Fault("réponse vide acceptée malgré RSG_NONULL");
    }
    std::istringstream lines{std::string(input)};
    for (std::string line; std::getline(lines, line);)
        velStripScriptComment(line);
    velSetUI(previous);
    return 0;
}

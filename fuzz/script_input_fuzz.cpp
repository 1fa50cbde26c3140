// Fuzz target of scripts and keyword input: the input's first line is a keyword list (its
// first byte also chooses the flags), the rest a script whose lines answer keyword and
// text prompts until it ends. A keyword answer is always one of the keywords offered.
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <sstream>
#include <string>

#include "velhost/editor.h"
#include "velhost/ui.h"

namespace {

[[noreturn]] void Fault(const std::string& what)
{
    std::fprintf(stderr, "%s\n", what.c_str());
    std::abort();
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    std::string_view input(reinterpret_cast<const char*>(data), size);
    const std::size_t end = input.find('\n');
    const std::string keywords(input.substr(0, end));
    std::istringstream script(std::string(end == std::string_view::npos ? std::string_view() : input.substr(end + 1)));
    std::ostringstream out;
    VelScriptedUI ui(script, out, "fuzz.scr");
    VelUserInterface* previous = velSetUI(&ui);
    const int flags = keywords.empty() ? 0 : (keywords[0] & RSG_NONULL);
    for (int prompt = 0; prompt < 1000 && !ui.inputEnded(); ++prompt) {
        std::string answer;
        if (prompt % 3 == 2) {
            if (acedGetString(prompt % 2 == 0, "Texte : ", answer) == RTNORM &&
                answer.find_first_of("\r\n") != std::string::npos)
                Fault("saut de ligne dans une réponse");
            continue;
        }
        acedInitGet(flags, keywords.c_str());
        const int status = acedGetKword("Choix : ", answer);
        if (status == RTNORM && (answer.empty() || (" " + keywords + " ").find(" " + answer + " ") == std::string::npos))
            Fault("mot-clé rendu qui n'était pas proposé : " + answer);
        if (status == RTNONE && (flags & RSG_NONULL))
            Fault("réponse vide acceptée malgré RSG_NONULL");
    }
    std::istringstream lines(std::string(input));
    for (std::string line; std::getline(lines, line);)
        velStripScriptComment(line);
    velSetUI(previous);
    return 0;
}

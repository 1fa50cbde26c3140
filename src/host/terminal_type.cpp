// Whether the terminal velhost runs in can show a full-screen dialog, asked of terminfo
// alone, before ncurses takes the screen (which would keep memory for an unknown type).
#include <unistd.h>

#include <cstdlib>
#include <string>

#include "host_internal.h"
#include "text/text.hpp"

// Last: terminfo's names are macros.
#define NCURSES_NOMACROS 1
#include <curses.h>
#include <term.h>

std::string velScreenTerminalProblem()
{
    if (!isatty(STDIN_FILENO) || !isatty(STDOUT_FILENO))
        return "l'entrée ou la sortie n'est pas un terminal";
    const char* type = std::getenv("TERM");
    if (type == nullptr || *type == '\0')
        return "la variable TERM n'est pas définie";
    if (std::string(type) == "dumb")
        return "le terminal « dumb » ne peut pas afficher un dialogue plein écran";
    int error = 0;
    TERMINAL* previous = cur_term;
    if (setupterm(type, STDOUT_FILENO, &error) != OK)
        return FormatString("type de terminal « %s » inconnu", type);
    const char* address = tigetstr("cup");
    const bool placesCursor = address != nullptr && address != reinterpret_cast<const char*>(-1);
    del_curterm(set_curterm(previous));
    if (!placesCursor)
        return FormatString("le terminal « %s » ne sait pas placer le curseur", type);
    return {};
}

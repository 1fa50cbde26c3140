// The host's command-line functions: output, keyword and text input, system variables
// and the search of files along the support path.
#pragma once

#include <string>
#include <vector>

#include "velhost/resbuf.h"

#pragma GCC visibility push(default)

// Flags of acedInitGet.
constexpr int RSG_NONULL = 0x0001; // an empty answer is refused

// Prints on the command line (a printf format; pass data as an argument, never as the
// format). Answers the number of bytes printed.
int acutPrintf(const char* format, ...) __attribute__((format(printf, 1, 2)));

// Sets the flags and keywords of the next input call only. Keywords are separated by
// blanks; a "_" alone separates the local keywords from the global ones of the same
// rank ("Oui Non _ Yes No").
int acedInitGet(int flags, const char* keywordList);

// Asks for a keyword. RTNORM: result is the keyword (the global one when the list has
// globals); RTNONE: an empty answer, allowed; RTCAN: cancelled or input ended. An answer
// may be a keyword, any start of it at least as long as its capital letters, or "_"
// and a global keyword; anything else is refused and asked again.
int acedGetKword(const char* prompt, std::string& result);

// Asks for a text: RTNORM with the text, RTCAN when cancelled.
int acedGetString(bool allowSpaces, const char* prompt, std::string& result);

// System variables. acedGetVar fills result (restype and value; a text value is owned
// by result and freed with acutRelRb on a list, or by the caller with velRbClear).
// RTNORM, or RTERROR for an unknown name; acedSetVar answers RTERROR also for a
// read-only variable, a value of the wrong type or out of range.
int acedGetVar(const char* name, resbuf* result);
int acedSetVar(const char* name, const resbuf* value);
// Frees what acedGetVar put in a buffer on the stack (its text).
void velRbClear(resbuf* rb);
// Names of the system variables, sorted.
std::vector<std::string> velSysVarNames();
// Value as text (GETVAR), and from text (SETVAR); "" / RTERROR when unknown.
std::string velSysVarText(const std::string& name);
int velSetSysVarText(const std::string& name, const std::string& text, std::string& error);

// Looks a file up: an absolute name as is, else in the modules folder, the current
// drawing's folder, the profile folder, then the working folder; when no folder has the
// exact name, names are matched without regard to case, as on Windows. Backslashes
// count as folder separators. RTNORM with the full path, or RTERROR.
int acedFindFile(const char* fileName, std::string& result);

#pragma GCC visibility pop

// Where the family's modules look for one another along the host's support path: the
// file name as given, then the family's "Programmes" folder above or below the folders
// searched. velLoadServiceModule takes the list.
#pragma once

#include <string>
#include <vector>

inline std::vector<std::string> VelModuleCandidates(const std::string& file)
{
    return {file, "..\\Programmes\\" + file, "Programmes\\" + file};
}

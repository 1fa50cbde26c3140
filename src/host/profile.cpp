// Host settings and the support path: where modules, the profile and the user's files
// are, and the search of a file along that path.
#include "velhost/profile.h"

#include <cstdlib>
#include <filesystem>

#include "host_internal.h"
#include "text/text.hpp"
#include "velhost/documents.h"
#include "velhost/editor.h"

namespace fs = std::filesystem;

VelHostSettings& velHostSettings()
{
    static VelHostSettings* settings = [] {
        auto* s = new VelHostSettings;
        s->profileDir = velDefaultProfileDir();
        s->profileName = fs::path(s->profileDir).filename().string();
        return s;
    }();
    return *settings;
}

std::string velDefaultProfileDir()
{
    const char* xdg = std::getenv("XDG_CONFIG_HOME");
    if (xdg != nullptr && *xdg != '\0')
        return (fs::path(xdg) / "velhost").string();
    const char* home = std::getenv("HOME");
    if (home != nullptr && *home != '\0')
        return (fs::path(home) / ".config" / "velhost").string();
    return (fs::current_path() / ".velhost").string();
}

namespace {

// The file under folder whose path matches name without regard to case, level by level,
// as names written for Windows expect; empty when there is none.
fs::path MatchIgnoringCase(const fs::path& folder, const fs::path& name)
{
    std::error_code ec;
    fs::path current = folder;
    for (const fs::path& part : name) {
        if (part == "." || part.empty())
            continue;
        if (part == "..") {
            current = current.parent_path();
            continue;
        }
        if (fs::exists(current / part, ec)) {
            current /= part;
            continue;
        }
        fs::path match;
        for (fs::directory_iterator it(current, ec), end; !ec && it != end; it.increment(ec)) {
            if (EqualsNoCase(it->path().filename().string(), part.string())) {
                match = it->path();
                break;
            }
        }
        if (match.empty())
            return {};
        current = match;
    }
    return fs::is_regular_file(current, ec) ? current : fs::path();
}

} // namespace

int acedFindFile(const char* fileName, std::string& result)
{
    if (fileName == nullptr || *fileName == '\0')
        return RTERROR;
    const fs::path name(velNativePath(fileName));
    std::error_code ec;
    if (name.is_absolute()) {
        if (!fs::is_regular_file(name, ec))
            return RTERROR;
        result = name.lexically_normal().string();
        return RTNORM;
    }
    std::vector<fs::path> folders;
    const VelHostSettings& settings = velHostSettings();
    if (!settings.modulesDir.empty())
        folders.emplace_back(settings.modulesDir);
    if (AcApDocument* doc = acDocManagerPtr()->curDocument(); doc && !doc->fileName().empty())
        folders.push_back(fs::absolute(fs::path(doc->fileName()), ec).parent_path());
    if (!settings.profileDir.empty())
        folders.emplace_back(settings.profileDir);
    folders.push_back(fs::current_path(ec));
    for (const fs::path& folder : folders) {
        const fs::path candidate = (folder / name).lexically_normal();
        if (fs::is_regular_file(candidate, ec)) {
            result = fs::absolute(candidate, ec).string();
            return RTNORM;
        }
    }
    for (const fs::path& folder : folders) {
        const fs::path match = MatchIgnoringCase(folder, name);
        if (!match.empty()) {
            result = fs::absolute(match, ec).lexically_normal().string();
            return RTNORM;
        }
    }
    return RTERROR;
}

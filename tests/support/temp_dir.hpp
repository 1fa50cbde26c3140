// A fresh folder under the system's temporary folder, removed with its content, and
// whole files read and written as bytes.
#pragma once

#include <filesystem>
#include <fstream>
#include <random>
#include <sstream>
#include <string>

// The whole content of a file; "" when it cannot be read.
inline std::string ReadFile(const std::filesystem::path& path)
{
    std::ifstream in(path, std::ios::binary);
    std::ostringstream s;
    s << in.rdbuf();
    return s.str();
}

// Replaces a file by `content`, making its folder first; answers the file's path.
inline std::string WriteFile(const std::filesystem::path& path, const std::string& content)
{
    if (path.has_parent_path())
        std::filesystem::create_directories(path.parent_path());
    std::ofstream(path, std::ios::binary) << content;
    return path.string();
}

class TempDir {
public:
    TempDir()
    {
        std::random_device rd;
        path = std::filesystem::temp_directory_path() / ("velhost_test_" + std::to_string(rd()));
        std::filesystem::create_directories(path);
    }
    ~TempDir()
    {
        std::error_code ec;
        std::filesystem::remove_all(path, ec);
    }
    TempDir(const TempDir&) = delete;
    TempDir& operator=(const TempDir&) = delete;

    std::string File(const std::string& name) const { return (path / name).string(); }
    std::string Write(const std::string& name, const std::string& content) const
    {
        return WriteFile(path / name, content);
    }
    std::string Read(const std::string& name) const { return ReadFile(path / name); }

    std::filesystem::path path;
};

// Loading plug-in libraries and letting each register its commands.
#include "PluginLoader.h"

#include <dirent.h>
#include <dlfcn.h>
#include <link.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cstring>
#include <exception>
#include <set>

namespace Kalmor {
namespace AutoCli {
namespace App {

namespace {

constexpr char kEntryPoint[] = "AutoCli_RegisterNamespaces";

std::vector<std::string> SplitPath(const std::string& path) {
    std::vector<std::string> directories;
    size_t start = 0;
    while (start <= path.size()) {
        size_t colon = path.find(':', start);
        if (colon == std::string::npos) {
            colon = path.size();
        }
        if (colon > start) {
            directories.push_back(path.substr(start, colon - start));
        }
        start = colon + 1;
    }
    return directories;
}

bool EndsWith(const std::string& text, const std::string& suffix) {
    return text.size() >= suffix.size() &&
           text.compare(text.size() - suffix.size(), suffix.size(), suffix) == 0;
}

// The plug-in files of a directory, sorted by name; empty when it cannot be read.
std::vector<std::string> PluginFiles(const std::string& directory) {
    std::vector<std::string> names;
    DIR* stream = opendir(directory.c_str());
    if (stream == nullptr) {
        return names;
    }
    while (const dirent* entry = readdir(stream)) {
        std::string name = entry->d_name;
        if (name.empty() || name[0] == '.' || !EndsWith(name, ".so")) {
            continue;
        }
        struct stat status;
        if (stat((directory + "/" + name).c_str(), &status) == 0 && S_ISREG(status.st_mode)) {
            names.push_back(name);
        }
    }
    closedir(stream);
    std::sort(names.begin(), names.end());
    return names;
}

// Opens a library and finds its entry point; nullptr, with a problem in `report`, when it
// cannot. The library is never closed: the tree will hold objects whose code lives in it.
void* OpenPlugin(const std::string& path, AutoCli_RegisterNamespacesFn& entry,
                 PluginReport& report) {
    // Functions are bound lazily: one command calls a few dozen of the hundreds that a plug-in
    // and its libraries import, and binding them all here took a tenth of `autocli --help`.
    // References from data (the commands' virtual tables among them) are still bound here, so
    // a plug-in built against another framework is still refused with the loader's reason.
    void* handle = dlopen(path.c_str(), RTLD_LAZY | RTLD_LOCAL);
    if (handle == nullptr) {
        const char* reason = dlerror();
        report.problems.push_back("cannot load plug-in " + path + ": " +
                                  (reason ? reason : "unknown error") + "; skipped");
        return nullptr;
    }
    void* symbol = dlsym(handle, kEntryPoint);
    if (symbol == nullptr) {
        report.problems.push_back("plug-in " + path + " has no " + kEntryPoint +
                                  " entry point; skipped");
        return nullptr;
    }
    entry = reinterpret_cast<AutoCli_RegisterNamespacesFn>(symbol);
    return handle;
}

}  // namespace

std::string ExecutableDirectory() {
    std::string path(4096, '\0');
    ssize_t length = readlink("/proc/self/exe", &path[0], path.size());
    if (length <= 0 || static_cast<size_t>(length) >= path.size()) {
        return std::string();
    }
    path.resize(static_cast<size_t>(length));
    size_t slash = path.rfind('/');
    return slash == std::string::npos ? std::string() : path.substr(0, slash == 0 ? 1 : slash);
}

std::vector<std::string> PluginDirectories(const char* overridePath,
                                           const std::string& defaultPath) {
    if (overridePath != nullptr && overridePath[0] != '\0') {
        return SplitPath(overridePath);
    }
    return SplitPath(defaultPath);
}

void LoadPlugins(const std::vector<std::string>& directories,
                 const std::shared_ptr<NamespaceNode>& root, PluginReport& report) {
    std::set<std::string> seenNames;
    // A library reached twice under different names (a link to it) registers once.
    std::set<void*> seenHandles;
    for (const auto& directory : directories) {
        for (const auto& name : PluginFiles(directory)) {
            if (!seenNames.insert(name).second) {
                continue;
            }
            const std::string path = directory + "/" + name;
            AutoCli_RegisterNamespacesFn entry = nullptr;
            void* handle = OpenPlugin(path, entry, report);
            if (handle != nullptr && seenHandles.insert(handle).second) {
                RegisterPlugin(entry, path, root, report);
            }
        }
    }
}

namespace {

struct NoteSearch {
    const std::string* path;
    std::string text;
};

// The text of the first note of type 1 owned by "AutoCli" in a loaded object's PT_NOTE
// segments.
int FindNote(dl_phdr_info* object, size_t, void* data) {
    auto* search = static_cast<NoteSearch*>(data);
    if (object->dlpi_name == nullptr || *search->path != object->dlpi_name) return 0;
    static const char kOwner[] = "AutoCli";
    for (int i = 0; i < object->dlpi_phnum; ++i) {
        const ElfW(Phdr)& segment = object->dlpi_phdr[i];
        if (segment.p_type != PT_NOTE) continue;
        const char* at = reinterpret_cast<const char*>(object->dlpi_addr + segment.p_vaddr);
        const char* end = at + segment.p_memsz;
        while (end - at >= static_cast<ptrdiff_t>(sizeof(ElfW(Nhdr)))) {
            const auto* note = reinterpret_cast<const ElfW(Nhdr)*>(at);
            const char* owner = at + sizeof(ElfW(Nhdr));
            const char* text = owner + ((note->n_namesz + 3) & ~3u);
            const char* next = text + ((note->n_descsz + 3) & ~3u);
            if (next > end) break;
            if (note->n_type == 1 && note->n_namesz == sizeof kOwner &&
                std::memcmp(owner, kOwner, sizeof kOwner) == 0) {
                search->text.assign(text, strnlen(text, note->n_descsz));
                return 1;
            }
            at = next;
        }
    }
    return 1;
}

}  // namespace

std::string PluginVersion(const std::string& path) {
    NoteSearch search{&path, std::string()};
    dl_iterate_phdr(FindNote, &search);
    return search.text;
}

bool LoadPlugin(const std::string& path, const std::shared_ptr<NamespaceNode>& root,
                PluginReport& report) {
    AutoCli_RegisterNamespacesFn entry = nullptr;
    return OpenPlugin(path, entry, report) != nullptr && RegisterPlugin(entry, path, root, report);
}

bool RegisterPlugin(AutoCli_RegisterNamespacesFn entry, const std::string& library,
                    const std::shared_ptr<NamespaceNode>& root, PluginReport& report) {
    std::shared_ptr<NamespaceNode> handle = root;
    try {
        entry(&handle);
    } catch (const std::exception& e) {
        report.problems.push_back("plug-in " + library +
                                  " failed to register its commands: " + e.what());
        return false;
    } catch (...) {
        report.problems.push_back("plug-in " + library +
                                  " failed to register its commands: unknown exception");
        return false;
    }
    report.loaded.push_back(library);
    return true;
}

}  // namespace App
}  // namespace AutoCli
}  // namespace Kalmor

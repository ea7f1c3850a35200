// Keeps what the function NAME of the plug-in PLUGIN makes for FOLDER in a static that is older than the library:
// at exit it is destroyed after the library's own statics. Usage: late_host PLUGIN NAME FOLDER
#include <cstdio>
#include <dlfcn.h>
#include <memory>

namespace {

std::shared_ptr<void> s_kept;

}

int main(int argc, char** argv)
{
    if (argc != 4) {
        return 2;
    }
    void* const plugin = dlopen(argv[1], RTLD_NOW);
    void* const make = plugin ? dlsym(plugin, argv[2]) : nullptr;
    if (!make) {
        std::fprintf(stderr, "%s\n", dlerror());
        return 2;
    }
    reinterpret_cast<void (*)(char const*, std::shared_ptr<void>&)>(make)(argv[3], s_kept);
    return s_kept ? 0 : 1;
}

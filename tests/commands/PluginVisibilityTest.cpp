// The loadable plug-in exports its five registration functions and nothing else of its own.

#include <cstdio>
#include <cstdlib>
#include <cxxabi.h>
#include <set>
#include <string>

#include <gtest/gtest.h>

namespace {

// Symbols the toolchain and the standard library put into any shared object.
bool IsToolchainOrLibrary(const std::string& name)
{
    static const std::set<std::string> linker = {"_init", "_fini", "__bss_start", "_edata", "_end"};
    if (linker.count(name)) {
        return true;
    }
    for (const char* prefix : {"std::", "__gnu_cxx::", "typeinfo for std::", "typeinfo name for std::",
                               "vtable for std::", "VTT for std::", "guard variable for std::", "operator"}) {
        if (name.rfind(prefix, 0) == 0) {
            return true;
        }
    }
    // Out-of-line instantiations of standard templates, e.g. "void std::vector<...>::..."
    return name.find(" std::") != std::string::npos && name.find("OrvaneCli") == std::string::npos;
}

std::string Demangle(const std::string& symbol)
{
    int status = 0;
    char* demangled = abi::__cxa_demangle(symbol.c_str(), nullptr, nullptr, &status);
    if (status != 0 || demangled == nullptr) {
        return symbol;
    }
    std::string name(demangled);
    std::free(demangled);
    return name;
}

TEST(PluginVisibilityTest, ExportsOnlyTheRegistrationFunctions)
{
    const std::string command = std::string("nm -D --defined-only --format=posix '") + STORAGECLI_PLUGIN + "'";
    FILE* pipe = popen(command.c_str(), "r");
    ASSERT_NE(pipe, nullptr);
    std::set<std::string> ours;
    char line[8192];
    while (fgets(line, sizeof line, pipe) != nullptr) {
        // "<mangled name> <type> <value> [<size>]": mangled names hold no blanks.
        const std::string text(line);
        const std::string name = Demangle(text.substr(0, text.find(' ')));
        if (!IsToolchainOrLibrary(name)) {
            ours.insert(name);
        }
    }
    ASSERT_EQ(pclose(pipe), 0);
    const std::set<std::string> expected = {
        "AutoCli_RegisterNamespaces",       "Core_RegisterInternalNamespaces",
        "Nmp_RegisterInternalNamespaces",   "ClusteredHdsk_RegisterInternalNamespace",
        "FilesystemNfs_RegisterNamespaces",
    };
    EXPECT_EQ(ours, expected);
}

} // namespace

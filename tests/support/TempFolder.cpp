#include "support/TempFolder.h"

#include <sys/stat.h>

#include <cstdlib>
#include <stdexcept>
#include <system_error>

namespace TestSupport {

TempFolder::TempFolder(const std::filesystem::path& base)
{
    std::string pattern = (base / "autocli-test-XXXXXX").string();
    if (!::mkdtemp(pattern.data()))
        throw std::runtime_error("mkdtemp failed for " + pattern);
    path_ = pattern;
    ::chmod(path_.c_str(), 0755);
}

TempFolder::~TempFolder()
{
    std::error_code ignored;
    std::filesystem::remove_all(path_, ignored);
}

} // namespace TestSupport

#pragma once

#include <string>

namespace TestSupport {

// The whole file, or "" when it cannot be read.
std::string ReadFile(const std::string& path);
// Replaces the file's content with `text`.
void WriteFile(const std::string& path, const std::string& text);

} // namespace TestSupport

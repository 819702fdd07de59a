#pragma once

#include <exception>
#include <string>

namespace Quillets {

// The framework's exception; the plug-in throws it only while registering.
class QuilletException : public std::exception {
public:
    explicit QuilletException(std::string message);
    ~QuilletException() override;
    const char* what() const noexcept override;

private:
    std::string message_;
};

} // namespace Quillets

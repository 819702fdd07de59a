#include "quillets/QuilletException.h"

namespace Quillets {

QuilletException::QuilletException(std::string message) : message_(std::move(message)) {}

QuilletException::~QuilletException() = default;

const char* QuilletException::what() const noexcept { return message_.c_str(); }

} // namespace Quillets

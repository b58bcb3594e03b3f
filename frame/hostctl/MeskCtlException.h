// The one exception type of the host-control library.
#pragma once

#include <exception>
#include <string>

#include "Visibility.h"

namespace HostCtl {
namespace Lib {
namespace Mesk {

class HOSTCTL_API MeskCtlException : public std::exception {
  public:
    explicit MeskCtlException(std::string message);
    ~MeskCtlException() override;
    // The text reported to the user.
    const std::string& GetMessage() const { return message_; }
    const char* what() const noexcept override;

  private:
    std::string message_;
};

}  // namespace Mesk
}  // namespace Lib
}  // namespace HostCtl

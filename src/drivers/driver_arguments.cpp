#include "drivers/driver_arguments.h"

#include "runtime/error_codes.h"
#include "runtime/list_file.h"
#include "runtime/process_log.h"
#include "runtime/raise.h"

namespace vlr {

std::vector<std::string> ReadDriverArguments(const char* argumentText, const char* title,
                                             const char* module) {
  std::vector<std::string> arguments = NVLR_UTILITY_SplitCommand(argumentText);
  if (arguments.size() < kDriverMinArguments) {
    NVLR_UTILITY_WriteStart(arguments, title, nullptr);
    NVLR_UTILITY_RaiseError(kCodeBadArgument, module, __LINE__, argumentText);
  }
  return arguments;
}

const std::string& DriverArgument(const std::vector<std::string>& arguments, size_t position) {
  static const std::string kEmpty;
  return position < arguments.size() ? arguments[position] : kEmpty;
}

}  // namespace vlr

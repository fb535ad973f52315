#include "platform/guard_exceptions.h"

#include <exception>
#include <string>

namespace vox::platform {

GuardReport CallCatchingExceptions(const std::function<void()>& fn) {
  GuardReport report;
  try {
    fn();
  } catch (const std::exception& error) {
    report.outcome = GuardOutcome::kException;
    report.description = std::string("exception: ") + error.what();
  } catch (...) {
    report.outcome = GuardOutcome::kException;
    report.description = "exception of unknown type";
  }
  return report;
}

}  // namespace vox::platform

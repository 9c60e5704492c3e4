#include "companions/upload/upload_results.h"

#include <algorithm>
#include <iterator>

#include "interfaces/qxlink_api.h"

namespace qxlink {
namespace {

struct ResultText {
  int32_t result;
  const char* text;
};

constexpr ResultText kTexts[] = {
    {QXSKYLANE_OK, "Done."},
    {QXSKYLANE_BAD_ARGUMENT, "The call has an argument that cannot be."},
    {QXSKYLANE_OUT_OF_MEMORY, "There is not enough memory."},
    {QXSKYLANE_NOT_SUPPORTED, "This version of the library, or the configured service, cannot do that."},
    {QXSKYLANE_CONFIGURATION_INVALID, "The library's configuration, qxlink.json, is not valid."},
    {QXSKYLANE_OPTION_UNKNOWN, "There is no such option of this type."},
    {QXSKYLANE_OPTION_REFUSED, "The configuration does not allow this value of the option."},
    {QXSKYLANE_FILE_UNREADABLE, "The file to upload cannot be read."},
    {QXSKYLANE_OUTBOX_UNWRITABLE, "The file cannot be written into the outbox folder."},
    {QXSKYLANE_CANCELLED, "The upload was cancelled."},
    {QXSKYLANE_INTERNAL_ERROR, "The library has failed."},
    {QXSKYLANE_NO_CONNECTION, "The service cannot be reached."},
    {QXSKYLANE_NO_SECURE_CHANNEL, "No secure channel to the service can be established."},
    {QXSKYLANE_TIMED_OUT, "The service did not answer in time."},
    {QXSKYLANE_SERVICE_REFUSED, "The service refused the request."},
    {QXSKYLANE_SERVICE_FAILED, "The service is out of order."},
};

}  // namespace

const char* TextOfResult(int32_t result) {
  const auto* const found = std::find_if(std::begin(kTexts), std::end(kTexts),
                                         [result](const ResultText& entry) { return entry.result == result; });
  return found == std::end(kTexts) ? "Unknown result." : found->text;
}

}  // namespace qxlink

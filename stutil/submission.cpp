#include "stutil/submission.h"

#include "core/logging.h"
#include "core/text.h"
#include "core/value.h"
#include "stutil/skylane_api.h"

namespace stutil {
namespace {

constexpr wchar_t kScope[] = L"TessaroSubmitFile";
constexpr char kCategory[] = "kvsetuplogs";

std::string TagDocument() {
  qx::Value tags;
  tags.Append(L"Quorvex Guard Basic");
  tags.Append(L"support_tool");
  qx::Value document;
  document.SetMember(L"tags", std::move(tags));
  return document.ToJsonText();
}

// A context of the library; ends with its owner, before the library is freed.
class SkylaneContext {
 public:
  explicit SkylaneContext(const SkylaneApi& api) : m_api(api), m_result(api.init(&m_context)) {}
  ~SkylaneContext() {
    if (m_result == QXSKYLANE_OK) m_api.uninit(m_context);
  }
  SkylaneContext(const SkylaneContext&) = delete;
  SkylaneContext& operator=(const SkylaneContext&) = delete;

  int32_t InitResult() const { return m_result; }

  // Falls back to plain HTTP once, when the library asks for it; the library decides whether that is allowed.
  int32_t Upload(const QxskylaneUpload& upload) const {
    int32_t result = m_api.fileUpload(m_context, &upload);
    if (result == QXSKYLANE_NO_SECURE_CHANNEL) {
      const int32_t optionResult = m_api.setOption(m_context, QXSKYLANE_OPTION_PLAIN_HTTP, 1);
      LOG_TRACE(kScope, L"Error [%d], falling back to plain http, setopt ret [%d]", result, optionResult);
      result = m_api.fileUpload(m_context, &upload);
    }
    return result;
  }

 private:
  const SkylaneApi& m_api;
  QxskylaneContext* m_context = nullptr;
  int32_t m_result;
};

}  // namespace

bool TessaroSubmitFile(int /*reserved*/, const std::wstring& path) {
  const std::string narrowPath = ToUtf8(path);
  const std::unique_ptr<SkylaneApi> api = LoadSkylaneApi();
  if (!api) {
    LOG_ERROR(kScope, L"error loading skylane library");
    return false;
  }
  const SkylaneContext context(*api);
  if (context.InitResult() != QXSKYLANE_OK) {
    LOG_ERROR(kScope, L"qxskylane error on context init %d", context.InitResult());
    return false;
  }
  const std::string tags = TagDocument();
  QxskylaneUpload upload{};
  upload.size = sizeof upload;
  upload.file_path = narrowPath.c_str();
  upload.category = kCategory;
  upload.tags_json = tags.c_str();
  const int32_t result = context.Upload(upload);
  if (result != QXSKYLANE_OK) {
    LOG_ERROR(kScope, L"qxskylane error uploading file '%s' %d", path.c_str(), result);
    return false;
  }
  return true;
}

}  // namespace stutil

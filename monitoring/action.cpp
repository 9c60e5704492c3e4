#include "monitoring/action.h"

#include "core/json.h"
#include "core/logging.h"
#include "core/text.h"
#include "monitoring/action_dump_process.h"

namespace st::monitoring {

std::shared_ptr<Action> Action::Create(const Json::Value& json, const ActionContext& context) {
  std::optional<ActionSettings> settings = ReadAction(json, LogNote);
  if (!settings) return nullptr;
  return std::make_shared<ActionDumpProcess>(std::move(*settings), context);  // there is no other kind
}

void Action::Run() {
  LOG_TRACE(L"st::monitoring::Action::Run", L"Running action with id='%s' and parameters='%s'", Id().c_str(),
            ParametersText().c_str());
}

std::wstring Action::ParametersText() const {
  std::string text = WriteCompactJson(m_settings.parameters);
  if (text.ends_with('\n')) text.pop_back();
  return ToWide(text);
}

}  // namespace st::monitoring

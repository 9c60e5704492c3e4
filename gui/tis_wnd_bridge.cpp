// Page and program call each other: the dispatcher of script calls, and the window's end of the bus.
#include <exception>
#include <utility>

#include "core/format.h"
#include "core/logging.h"
#include "gui/tis_wnd.h"

namespace {

constexpr wchar_t kCallScope[] = L"TisWnd::on_script_call";
constexpr wchar_t kNotifScope[] = L"TisWnd::TisNotif";
constexpr wchar_t kFunctionScope[] = L"TisWnd::TisCallFunction";
constexpr wchar_t kNotified[] = L"on_api_notif";  // of the page
constexpr wchar_t kError[] = L"error";
constexpr uint32_t kMostArguments = 2;

// A page may send megabytes; the log is for reading.
std::wstring LogText(const qx::Value& value) {
  constexpr size_t kLongest = 8192;
  if (!logging::IsEnabled()) return {};
  std::wstring text = value.ToText();
  if (text.size() > kLongest) text.replace(kLongest, std::wstring::npos, L"...");
  return text;
}

qx::Value ErrorAnswer(std::wstring_view text) {
  qx::Value answer;
  answer.SetMember(kError, text);
  return answer;
}

void LogCall(const std::wstring& name, uint32_t count, const qx::Value& request) {
  if (!logging::IsEnabled()) return;
  std::wstring parameters;
  if (count > 0) parameters = Format(L"[param%u = %s]", 0u, LogText(request).c_str());
  if (count > 1) parameters += Format(L"[param%u = %s]", 1u, L"function");
  LOG_TRACE(kCallScope, L"[functionName = %s] [n_params = %d] [params = %s]", name.c_str(), count, parameters.c_str());
}

}  // namespace

qx::Value TisWnd::on_script_call(const std::wstring& name, uint32_t count, const HtmlValue* arguments) {
  if (count > kMostArguments) {
    return ErrorAnswer(L"Expecting 0/1 arguments for sync calls or 2 for async calls.");
  }
  try {
    qx::Value request = count > 0 ? qx::gui::FromEngine(Api(), arguments[0]) : qx::Value();
    LogCall(name, count, request);
    const std::wstring topic = L"tis_" + name;
    return count < 2 ? CallSynchronously(topic, std::move(request))
                     : CallAsynchronously(topic, std::move(request), arguments[1]);
  } catch (const std::exception& exception) {  // a message beyond the limits, or no memory for it
    LOG_ERROR(kCallScope, L"[functionName = %s] [%S]", name.c_str(), exception.what());
    return ErrorAnswer(L"The message cannot be read.");
  }
}

qx::Value TisWnd::CallSynchronously(const std::wstring& topic, qx::Value request) {
  return Publish(topic, std::move(request));
}

// The answer is for the script function; the call itself has none.
qx::Value TisWnd::CallAsynchronously(const std::wstring& topic, qx::Value request, const HtmlValue& callback) {
  if (!qx::gui::IsScriptFunction(Api(), callback)) return ErrorAnswer(L"The second argument is not a function.");
  const uint64_t id = ++m_lastCallback;
  m_callbacks.emplace(id, std::make_unique<qx::gui::EngineValue>(Api(), callback));
  const bool posted = m_calls.Post([this, id, topic, request = std::move(request)]() mutable {
    qx::Value response = Publish(topic, std::move(request));
    Ui().Post([this, id, response = std::move(response)] { AnswerScript(id, response); });
  });
  if (posted) return {};
  m_callbacks.erase(id);
  LOG_ERROR(kCallScope, L"too many calls are waiting, %s is refused", topic.c_str());
  return ErrorAnswer(L"Too many calls are waiting.");
}

// Any thread.
qx::Value TisWnd::Publish(const std::wstring& topic, qx::Value request) const {
  qx::Value message;
  message.SetMember(qx::kRequest, std::move(request));
  message.SetMember(qx::kResponse, qx::Value::EmptyObject());
  m_services.bus->Publish(topic, message);
  return std::move(message.Member(qx::kResponse));
}

void TisWnd::AnswerScript(uint64_t callback, const qx::Value& response) {
  const auto found = m_callbacks.find(callback);
  if (found == m_callbacks.end()) return;
  const std::unique_ptr<qx::gui::EngineValue> function = std::move(found->second);
  m_callbacks.erase(found);  // before the call, in which the script may call again
  if (m_isClosing) return;
  try {
    qx::gui::EngineValue argument(Api());
    qx::gui::ToEngine(Api(), response, *argument.Receive());
    if (!function->Invoke(*argument.Get())) LOG_WARNING(kCallScope, L"the script function for an answer failed");
  } catch (const qx::gui::ConversionError& error) {
    LOG_ERROR(kCallScope, L"an answer cannot be passed on: %S", error.what());
  }
}

// Any thread. The page itself can publish this topic too, with a message of another shape.
void TisWnd::TisNotif(qx::Value& message) {
  try {
    Ui().Post(
        [this, name = std::wstring(message.Member(qx::kFunctionName).AsString()), data = message.Member(qx::kData)] {
          LOG_TRACE(kNotifScope, L"%p on_api_notif [functionName %s] [param %s]", Handle(), name.c_str(),
                    LogText(data).c_str());
          const qx::Value functionName(name);
          CallPage(kNotified, {&functionName, &data});
        });
  } catch (const qx::ValueException& exception) {
    LOG_ERROR(kNotifScope, L"invalid notification [%S]", exception.what());
  }
}

// Any thread; returns when the page has answered, or the window is gone.
void TisWnd::TisCallFunction(qx::Value& message) {
  LOG_TRACE(kFunctionScope, L"%p [callData = %s]", Handle(), LogText(message).c_str());
  try {
    const std::wstring name(message.Member(qx::kFunctionName).AsString());
    const qx::Value& arguments = message.Member(qx::kArguments);
    qx::Value response;
    Ui().Call([&] {
      response = CallPage(name, {&arguments}).value_or(qx::Value());
      LOG_TRACE(kFunctionScope, L"%p [response = %s]", Handle(), LogText(response).c_str());
    });
    message.SetMember(qx::kResponse, std::move(response));
  } catch (const qx::ValueException& exception) {
    LOG_ERROR(kFunctionScope, L"invalid call_function json [%S]'", exception.what());
  }
}

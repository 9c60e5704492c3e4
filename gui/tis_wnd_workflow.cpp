// The handlers of the page's calls, and the submission.
#include <ctime>
#include <exception>
#include <iterator>
#include <utility>

#include "core/files.h"
#include "core/logging.h"
#include "core/paths.h"
#include "core/scope_exit.h"
#include "core/scope_trace.h"
#include "core/text.h"
#include "gui/tis_wnd.h"
#include "gui/user_details.h"

namespace {

constexpr wchar_t kSuccess[] = L"success";
constexpr wchar_t kIssue[] = L"issue";
constexpr wchar_t kName[] = L"name";
constexpr wchar_t kDescription[] = L"description";
constexpr wchar_t kFinished[] = L"on_finished";
constexpr wchar_t kError[] = L"on_error";
constexpr wchar_t kProgress[] = L"on_submit_progress";

// By the number of the result.
struct Outcome {
  const wchar_t* logText;
  const wchar_t* notification;
  const wchar_t* data;
};
constexpr Outcome kOutcomes[] = {
    {L"COLLECT_SUCCESS", kFinished, nullptr},
    {L"COLLECT_FAILED", kError, L"collect_failed"},
    {L"COLLECT_CANCELED", kError, L"collect_canceled"},
    {L"COMPRESSION_FAILED", kError, L"compression_failed"},
    {L"SUBMISSION_FAILED", kError, L"submission_failed"},
};

qx::Value& Response(qx::Value& message) {
  return message.Member(qx::kResponse);
}

void SetSuccess(qx::Value& message, bool success) {
  Response(message).SetMember(kSuccess, success);
}

bool AsBool(const qx::Value& value) {
  if (value.GetType() != qx::Value::kBool) throw qx::ValueException(L"not a boolean: " + value.ToText());
  return value.IsTrue();
}

double SecondsSince1970() {
  return static_cast<double>(std::time(nullptr));
}

}  // namespace

void TisWnd::TisValidateUserDetails(qx::Value& message) {
  constexpr wchar_t kScope[] = L"TisWnd::TisValidateUserDetails";
  SetSuccess(message, false);
  try {
    const qx::Value& request = message.Member(qx::kRequest);
    const std::wstring_view name = Trimmed(request.Member(L"user_name").AsString());
    const std::wstring_view email = Trimmed(request.Member(L"user_email").AsString());
    const bool agreed = AsBool(request.Member(L"agreed_licence"));
    const bool isReachable = qx::IsEmailAddress(email);
    if (name.empty() || !isReachable || !agreed) {
      LOG_TRACE(kScope, L"%d %d %d", name.empty() ? 0 : 1, isReachable ? 1 : 0, agreed ? 1 : 0);
      return;
    }
    qx::Value details;
    details.SetMember(kName, name);
    details.SetMember(L"email", email);
    {
      const std::lock_guard lock(m_dataMutex);
      m_data.SetMember(L"user_details", std::move(details));
    }
    SetSuccess(message, true);
  } catch (const qx::ValueException& exception) {
    LOG_ERROR(kScope, L"[%S]", exception.what());
  }
}

void TisWnd::TisSelectIssue(qx::Value& message) {
  constexpr wchar_t kScope[] = L"TisWnd::TisSelectIssue";
  SetSuccess(message, false);
  try {
    const qx::Value& request = message.Member(qx::kRequest);
    const qx::String issue = request.Member(kIssue).AsString();
    const qx::String description = request.Member(kDescription).AsString();
    StoreInIssue(kName, qx::Value(issue));
    StoreInIssue(kDescription, qx::Value(description));
    SetSuccess(message, true);
  } catch (const qx::ValueException& exception) {
    LOG_ERROR(kScope, L"[%S]", exception.what());
  }
}

void TisWnd::TisStartIssueReproduction(qx::Value& message) {
  constexpr wchar_t kScope[] = L"TisWnd::TisStartIssueReproduction";
  SetSuccess(message, false);
  m_isReproducing = true;  // before it: half of it may be raised even when it fails
  if (!m_services.activateLogging()) {
    LOG_ERROR(kScope, L"Could not activate product logging");
    RestoreLogging();
    return;
  }
  StoreInIssue(L"reproduce_start_time", SecondsSince1970());
  SetSuccess(message, true);
}

void TisWnd::TisStopIssueReproduction(qx::Value& message) {
  constexpr wchar_t kScope[] = L"TisWnd::TisStopIssueReproduction";
  SetSuccess(message, false);
  if (!m_services.disableLogging()) {
    LOG_ERROR(kScope, L"Could not disable product logging");
    return;
  }
  m_isReproducing = false;
  StoreInIssue(L"reproduce_stop_time", SecondsSince1970());
  SetSuccess(message, true);
}

void TisWnd::StoreInIssue(const wchar_t* key, qx::Value value) {
  const std::lock_guard lock(m_dataMutex);
  if (m_data.GetType() == qx::Value::kNull || !m_data.HasMember(kIssue)) {
    m_data.SetMember(kIssue, qx::Value::EmptyObject());
  }
  m_data.Member(kIssue).SetMember(key, std::move(value));
}

// Two clicks are one submission: a second one while the first runs only says that it runs.
void TisWnd::TisSubmitData(qx::Value& message) {
  constexpr wchar_t kScope[] = L"TisWnd::TisSubmitData";
  SetSuccess(message, true);
  try {
    StoreInIssue(L"can_be_reproduced", AsBool(message.Member(qx::kRequest).Member(L"issue_reproduced")));
  } catch (const qx::ValueException& exception) {
    LOG_ERROR(kScope, L"[%S]", exception.what());
  }
  const qx::Value report = ReportData();
  LOG_TRACE(kScope, L"m_data = [%S]", report.ToJsonText().c_str());
  if (m_isSubmitting.exchange(true)) {
    LOG_WARNING(kScope, L"a submission is under way already");
    return;
  }
  m_cancel = false;
  if (!m_submission.Post([this, report] { SubmitData(report); })) m_isSubmitting = false;
}

void TisWnd::TisTranslate(qx::Value& message) {
  constexpr wchar_t kScope[] = L"TisWnd::TisTranslate";
  SetSuccess(message, false);
  try {
    const std::wstring text(message.Member(qx::kRequest).AsString());
    const std::shared_ptr<qx::ILanguageManager> manager = Language();
    if (manager == nullptr) return;  // logged when it could not be had
    std::wstring translation;
    if (const uint32_t error = manager->Translate(text, translation); error != 0) {
      LOG_ERROR(kScope, L"[%S]", ("no translation, error " + std::to_string(error)).c_str());
      return;
    }
    Response(message).SetMember(L"translation", translation);
    SetSuccess(message, true);
  } catch (const qx::ValueException& exception) {
    LOG_ERROR(kScope, L"[%S]", exception.what());
  }
}

std::shared_ptr<qx::ILanguageManager> TisWnd::Language() {
  const std::lock_guard lock(m_dataMutex);
  if (!std::exchange(m_isLanguageAsked, true)) m_language = m_services.languageManager(m_catalogue);
  return m_language;
}

void TisWnd::TisCancel(qx::Value& message) {
  m_cancel = true;
  SetSuccess(message, m_isSubmitting);
}

void TisWnd::TisMinimize(qx::Value& message) {
  SetSuccess(message, Ui().Post([this] { ShowWindow(Handle(), SW_MINIMIZE); }));
}

// Whoever waits for the event asks the window to close.
void TisWnd::TisClose(qx::Value& message) {
  m_isClosing = m_stopEvent != nullptr && SetEvent(m_stopEvent);
  SetSuccess(message, m_isClosing);
}

// What the page may show besides: the product, whether logging is raised, and where the package lies, if it was kept.
void TisWnd::TisGetState(qx::Value& message) {
  qx::Value& response = Response(message);
  response.SetMember(L"reproducing", m_isReproducing.load());
  response.SetMember(L"submitting", m_isSubmitting.load());
  std::wstring package;
  {
    const std::lock_guard lock(m_dataMutex);
    if (!m_outputFolder.empty()) package = m_outputFolder + L".zip";
  }
  if (!package.empty() && PathExists(package)) response.SetMember(L"package", package);
  const std::shared_ptr<qx::IServConfig> config = m_services.productConfig();
  for (const wchar_t* key : {L"product_name", L"product_version"}) {
    std::wstring text;
    if (config != nullptr && config->GetText(key, text) == 0) response.SetMember(key, text);
  }
  SetSuccess(message, true);
}

// On its own thread, once for each submission; what it tells the page goes through the bus.
void TisWnd::SubmitData(const qx::Value& report) {
  constexpr wchar_t kScope[] = L"TisWnd::SubmitData";
  const logging::ScopeTrace trace(kScope);
  int result = qx::kCollectionFailed;
  try {
    RestoreLogging();  // nothing is reproduced any more, whatever the page has left out
    result = m_services.collectData(
        m_cancel, [this](int current, int total) { ReportProgress(current, total); },
        [this, &report](const std::wstring& folder) { return WriteReport(folder, report); });
  } catch (const std::exception& exception) {
    LOG_ERROR(kScope, L"[%S]", exception.what());
  }
  m_isSubmitting = false;  // before the page is told: it may submit again at once
  ReportResult(result);
}

bool TisWnd::WriteReport(const std::wstring& folder, const qx::Value& report) {
  constexpr wchar_t kScope[] = L"TisWnd::WriteReport";
  {
    const std::lock_guard lock(m_dataMutex);
    m_outputFolder = ShownPath(ExtendedPath(WithoutEndSeparators(folder)));  // for the user, who knows no current one
  }
  LOG_TRACE(kScope, L"-> json data");
  const DWORD error = WriteWholeFile(JoinPath(folder, L"guiData.json"), report.ToJsonText());
  if (error != ERROR_SUCCESS) LOG_ERROR(kScope, L"guiData.json cannot be written, error %d", error);
  LOG_TRACE(kScope, L"<- json data");
  return error == ERROR_SUCCESS;
}

void TisWnd::ReportProgress(int current, int total) {
  LOG_TRACE(L"TisWnd::SubmitData", L"Step %d/%d", current, total);
  qx::Value data;
  data.SetMember(L"step", current);
  data.SetMember(L"steps", total);
  m_comm->Notify(kProgress, data);
}

void TisWnd::ReportResult(int result) {
  constexpr wchar_t kScope[] = L"TisWnd::SubmitData";
  if (result < 0 || result >= static_cast<int>(std::size(kOutcomes))) {
    LOG_ERROR(kScope, L"[error %d]", result);
    m_comm->Notify(kError, L"unknown");
    return;
  }
  const Outcome& outcome = kOutcomes[result];
  LOG_TRACE(kScope, L"%s", outcome.logText);
  if (outcome.data == nullptr) {
    m_comm->Notify(outcome.notification);
  } else {
    m_comm->Notify(outcome.notification, outcome.data);
  }
}

#include "gui/tis_wnd.h"

#include <utility>

#include "core/files.h"
#include "core/logging.h"
#include "core/paths.h"
#include "core/text.h"
#include "gui/install_info.h"
#include "gui/language.h"
#include "gui/window_messages.h"

namespace {

constexpr wchar_t kWindowName[] = L"support_tool";
constexpr wchar_t kInitScope[] = L"TisWnd::Init";

}  // namespace

// The only list.
const TisWnd::HandlerEntry TisWnd::kHandlers[] = {
    {qx::kNotifyTopic, &TisWnd::TisNotif},
    {qx::kCallFunctionTopic, &TisWnd::TisCallFunction},
    {L"tis_validate_user_details", &TisWnd::TisValidateUserDetails},
    {L"tis_select_issue", &TisWnd::TisSelectIssue},
    {L"tis_start_issue_reproduction", &TisWnd::TisStartIssueReproduction},
    {L"tis_stop_issue_reproduction", &TisWnd::TisStopIssueReproduction},
    {L"tis_submit", &TisWnd::TisSubmitData},
    {L"tis_translate", &TisWnd::TisTranslate},
    {L"tis_cancel", &TisWnd::TisCancel},
    {L"tis_minimize", &TisWnd::TisMinimize},
    {L"tis_close", &TisWnd::TisClose},
    {L"tis_get_state", &TisWnd::TisGetState},
};

TisWnd::TisWnd(qx::TisServices services)
    : Window(*services.engine, kWindowName),
      m_services(std::move(services)),
      m_comm(std::make_unique<qx::TisComm>(m_services.bus)) {}

TisWnd::~TisWnd() {
  m_cancel = true;
  m_callbacks.clear();
  Ui().Detach();  // lets go whoever waits for the page
  RestoreLogging();
}

bool TisWnd::Init(HWND parent) {
  Subscribe();
  std::wstring language;
  if (!GetLanguageFromInstallInfo(language)) {
    language = qx::kDefaultLanguage;
    LOG_TRACE(kInitScope, L"could not find language from install info. loading default language [language %s]",
              language.c_str());
  }
  const std::wstring page = qx::PageForLanguage(language);
  m_catalogue = qx::CatalogueOfPage(page);
  m_pagePath = JoinPath(JoinPath(m_services.programFolder, L"gui\\new"), page + L".html").c_str();
  if (CreateFromFile(m_pagePath, parent)) return true;
  OnLoadFailed();
  return false;
}

void TisWnd::Subscribe() {
  for (const HandlerEntry& entry : kHandlers) {
    m_comm->Subscribe(entry.topic, [this, handler = entry.handler](qx::Value& message) { (this->*handler)(message); });
  }
}

bool TisWnd::GetInstallInfo(qx::Value& info) const {
  constexpr wchar_t kScope[] = L"TisWnd::GetInstallInfo";
  const std::wstring path(
      JoinPath(JoinPath(JoinPath(m_services.programFolder, L"kitinstaller"), L"settings"), L"install_info.yaml")
          .c_str());
  if (!PathExists(path)) {
    LOG_TRACE(kScope, L"could not find install info file from kit installer");
    return false;
  }
  std::string text;
  if (const DWORD error = ReadWholeFile(path, qx::kLargestInstallInfo, text); error != ERROR_SUCCESS) {
    LOG_ERROR(kScope, L"%s cannot be read, error %d", path.c_str(), error);
    return false;
  }
  std::string error;
  if (qx::ParseYaml(text, info, error)) return true;
  LOG_ERROR(kScope, L"%s is not usable: %S", path.c_str(), error.c_str());
  return false;
}

bool TisWnd::GetLanguageFromInstallInfo(std::wstring& language) const {
  constexpr wchar_t kScope[] = L"TisWnd::GetLanguageFromInstallInfo";
  qx::Value info;
  if (!GetInstallInfo(info)) return false;
  try {
    language = info.Member(L"UserPreferences").Member(L"language").AsString();
    return true;
  } catch (const qx::ValueException& exception) {
    LOG_ERROR(kScope, L"can't find language chosen in the installer [%S]", exception.what());
    return false;
  }
}

qx::Value TisWnd::ReportData() const {
  const std::lock_guard lock(m_dataMutex);
  return m_data;
}

bool TisWnd::OnMessage(UINT message, WPARAM wparam, LPARAM lparam, LRESULT& result) {
  if (message == WM_ENDSESSION && wparam != FALSE) RestoreLogging();  // the process may be ended right after
  return Window::OnMessage(message, wparam, lparam, result);
}

void TisWnd::OnDestroyed() {
  m_cancel = true;
  m_callbacks.clear();
  RestoreLogging();
  if (m_stopEvent != nullptr) SetEvent(m_stopEvent);
  PostQuitMessage(0);
}

void TisWnd::OnLoadFailed() {
  LOG_ERROR(kInitScope, L"Failed to create window from file '%s'", m_pagePath.c_str());
  if (Handle() != nullptr) Tell(qx::kPageFailedText);  // where no window can be, no message can
}

// What a user records, he can no longer stop.
void TisWnd::OnPageLost() {
  LOG_ERROR(L"TisWnd::OnPageLost", L"the page is lost; the window is closed");
  m_cancel = true;
  RestoreLogging();
  Tell(qx::kPageLostText);
  if (Handle() != nullptr) PostMessageW(Handle(), WM_CLOSE, 0, 0);
}

void TisWnd::Tell(const wchar_t* text) {
  const std::shared_ptr<qx::ILanguageManager> manager = Language();
  std::wstring translation;
  const bool isTranslated = manager != nullptr && manager->Translate(text, translation) == 0;
  m_services.showMessage(Handle(), isTranslated ? translation : text);
}

void TisWnd::RestoreLogging() {
  if (m_isReproducing.exchange(false)) m_services.restoreLogging();
}

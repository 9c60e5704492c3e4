// The issue-report window: it shows the page in the user's language, answers the calls of the page's script, and runs
// the submission. What the user enters is gathered in one value that travels with the collected data.
#pragma once

#include <windows.h>

#include <atomic>
#include <cstdint>
#include <map>
#include <memory>
#include <mutex>
#include <string>

#include "core/value.h"
#include "gui/background_worker.h"
#include "gui/engine_value.h"
#include "gui/tis_comm.h"
#include "gui/tis_services.h"
#include "gui/window.h"

// For one thread, that of the message loop. Handlers run on the thread that publishes: this one for synchronous script
// calls, a background thread for asynchronous ones; the submission runs on a thread of its own.
class TisWnd : public qx::gui::Window {
 public:
  explicit TisWnd(qx::TisServices services);
  ~TisWnd() override;  // waits for a submission under way, which was told to cancel

  // Signalled when the window is gone or the page asks to close. The caller owns the event, which outlives the window.
  void SetStopEvent(HANDLE event) { m_stopEvent = event; }

  // Subscribes the handlers, picks the page and creates the window. False when there is no window.
  bool Init(HWND parent = nullptr);

  bool GetInstallInfo(qx::Value& info) const;
  bool GetLanguageFromInstallInfo(std::wstring& language) const;

  qx::Value ReportData() const;  // a copy

 protected:
  bool OnMessage(UINT message, WPARAM wparam, LPARAM lparam, LRESULT& result) override;
  void OnDestroyed() override;
  void OnLoadFailed() override;
  void OnPageLost() override;
  qx::Value on_script_call(const std::wstring& name, uint32_t count, const HtmlValue* arguments) override;

 private:
  using Handler = void (TisWnd::*)(qx::Value& message);
  struct HandlerEntry {
    const wchar_t* topic;
    Handler handler;
  };
  static const HandlerEntry kHandlers[];

  void Subscribe();
  void Tell(const wchar_t* text);

  // The bridge.
  qx::Value CallSynchronously(const std::wstring& topic, qx::Value request);
  qx::Value CallAsynchronously(const std::wstring& topic, qx::Value request, const HtmlValue& callback);
  qx::Value Publish(const std::wstring& topic, qx::Value request) const;
  void AnswerScript(uint64_t callback, const qx::Value& response);
  void TisNotif(qx::Value& message);
  void TisCallFunction(qx::Value& message);

  // The workflow.
  void TisValidateUserDetails(qx::Value& message);
  void TisSelectIssue(qx::Value& message);
  void TisStartIssueReproduction(qx::Value& message);
  void TisStopIssueReproduction(qx::Value& message);
  void TisSubmitData(qx::Value& message);
  void TisTranslate(qx::Value& message);
  void StoreInIssue(const wchar_t* key, qx::Value value);

  // Of the window: cancelling a submission, the frame's buttons that the page draws, and what the page may show.
  void TisCancel(qx::Value& message);
  void TisMinimize(qx::Value& message);
  void TisClose(qx::Value& message);
  void TisGetState(qx::Value& message);

  // The submission.
  void SubmitData(const qx::Value& report);
  bool WriteReport(const std::wstring& folder, const qx::Value& report);
  void ReportProgress(int current, int total);
  void ReportResult(int result);

  void RestoreLogging();
  std::shared_ptr<qx::ILanguageManager> Language();

  const qx::TisServices m_services;
  std::unique_ptr<qx::TisComm> m_comm;
  HANDLE m_stopEvent = nullptr;
  std::wstring m_pagePath;
  std::wstring m_catalogue;

  mutable std::mutex m_dataMutex;  // for the four below
  qx::Value m_data;
  std::wstring m_outputFolder;  // of the last submission
  std::shared_ptr<qx::ILanguageManager> m_language;
  bool m_isLanguageAsked = false;

  std::atomic<bool> m_cancel{false};
  std::atomic<bool> m_isSubmitting{false};
  std::atomic<bool> m_isReproducing{false};
  std::atomic<bool> m_isClosing{false};  // the page has asked for it: answers that wait would only be in the way

  // The script functions that wait for an answer; they never leave this thread.
  std::map<uint64_t, std::unique_ptr<qx::gui::EngineValue>> m_callbacks;
  uint64_t m_lastCallback = 0;

  qx::BackgroundWorker m_calls;  // the asynchronous script calls; last, so that they end first
  qx::BackgroundWorker m_submission;
};

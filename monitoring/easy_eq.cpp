#include "monitoring/easy_eq.h"

#include <exception>
#include <utility>

#include "core/logging.h"

namespace st::monitoring {
namespace {

constexpr wchar_t kInit[] = L"st::monitoring::EasyEQ::Init";

DynamicLibrary LoadFramework(const std::wstring& path) {
  DynamicLibrary library(path.c_str());
  if (library) return library;
  return DynamicLibrary(path.c_str(), LOAD_WITH_ALTERED_SEARCH_PATH);
}

}  // namespace

void EasyEQTask::Run() const noexcept {
  try {
    m_item->Run();
  } catch (const std::exception& exception) {
    LOG_ERROR(L"st::monitoring::EasyEQTask::Run", L"unexpected failure: %S", exception.what());
  } catch (...) {
    LOG_ERROR(L"st::monitoring::EasyEQTask::Run", L"unexpected failure");
  }
}

EasyEQ::~EasyEQ() {
  Close();
}

int32_t EasyEQ::Init(const std::wstring& libraryPath) {
  DynamicLibrary library = LoadFramework(libraryPath);
  if (!library) {
    const DWORD error = GetLastError();
    LOG_ERROR(kInit, L"error loading %s: %d", libraryPath.c_str(), error);
    return error == ERROR_SUCCESS ? ERROR_MOD_NOT_FOUND : static_cast<int32_t>(error);
  }
  const auto create = library.Resolve<decltype(&QxCreateObject)>("QxCreateObject");
  const auto destroy = library.Resolve<decltype(&QxDestroyObject)>("QxDestroyObject");
  if (create == nullptr || destroy == nullptr) {
    LOG_ERROR(kInit, L"%s does not export %S", libraryPath.c_str(),
              create == nullptr ? "QxCreateObject" : "QxDestroyObject");
    return ERROR_PROC_NOT_FOUND;
  }
  void* object = nullptr;
  const int32_t result = create(EVENT_QUEUE_OBJECT_NAME, EVENT_QUEUE_INTERFACE_1, &object);
  if (result != EVENT_QUEUE_OK || object == nullptr) {
    LOG_ERROR(kInit, L"QxCreateObject %s returned %d", EVENT_QUEUE_OBJECT_NAME, result);
    return result == EVENT_QUEUE_OK ? EVENT_QUEUE_UNKNOWN_OBJECT : result;
  }
  m_library = std::move(library);
  m_destroyObject = destroy;
  m_queue = static_cast<EventQueue*>(object);
  return 0;
}

bool EasyEQ::Schedule(const wchar_t* subscriber, int32_t periodMs, std::unique_ptr<EqWorkItem> item,
                      EventQueueHandle& handle) {
  auto task = std::make_unique<EasyEQTask>(*this, std::move(item));
  EasyEQTask* const key = task.get();
  {
    const std::lock_guard lock(m_mutex);
    m_tasks.emplace(key, std::move(task));
  }
  const EventQueueItem request{sizeof request, periodMs, subscriber, &OnRun, &OnFinished, key};
  const int32_t result = m_queue->SchedulePeriodic(m_queue, &request, &handle);
  if (result == EVENT_QUEUE_OK) return true;
  LOG_ERROR(L"st::monitoring::EasyEQ::Schedule", L"a work item with the period %d cannot be scheduled: %d", periodMs,
            result);
  Remove(key);
  return false;
}

void EasyEQ::Cancel(EventQueueHandle handle) {
  const int32_t result = m_queue->Cancel(m_queue, handle);
  if (result == EVENT_QUEUE_OK || result == EVENT_QUEUE_UNKNOWN_ITEM || result == EVENT_QUEUE_STILL_RUNNING) return;
  LOG_ERROR(L"st::monitoring::EasyEQ::Cancel", L"a work item cannot be cancelled: %d", result);
}

void EasyEQ::Close() {
  if (m_queue == nullptr) return;
  if (const int32_t result = m_destroyObject(m_queue); result != EVENT_QUEUE_OK) {
    LOG_ERROR(L"st::monitoring::EasyEQ::Close", L"QxDestroyObject returned %d", result);
  }
  m_queue = nullptr;  // work items used it until now
}

void EasyEQ::OnRun(void* user, EventQueueHandle) {
  static_cast<const EasyEQTask*>(user)->Run();
}

void EasyEQ::OnFinished(void* user, EventQueueHandle) {
  const auto* const task = static_cast<const EasyEQTask*>(user);
  task->Owner().Remove(task);
}

void EasyEQ::Remove(const EasyEQTask* task) {
  decltype(m_tasks)::node_type removed;  // destroyed outside the lock
  const std::lock_guard lock(m_mutex);
  removed = m_tasks.extract(task);
}

}  // namespace st::monitoring

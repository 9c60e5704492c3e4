#include "systeminfo/handle_types.h"

#include <array>
#include <atomic>
#include <memory>
#include <system_error>
#include <thread>

#include "core/abandoned_threads.h"
#include "core/logging.h"
#include "systeminfo/handle_table.h"

namespace systeminfo {
namespace {

constexpr wchar_t kScope[] = L"ProcessHandlerHelper::GetHandleInformationForProcess";
constexpr auto kObjectTypeInformation = static_cast<OBJECT_INFORMATION_CLASS>(2);
constexpr size_t kReplySize = 4096;

std::optional<std::wstring> TypeOf(const ObjectCalls& calls, HANDLE process, uint16_t value) {
  KernelHandle duplicate;
  const HANDLE source = reinterpret_cast<HANDLE>(static_cast<uintptr_t>(value));
  if (calls.duplicate(process, source, GetCurrentProcess(), duplicate.Receive(), 0, 0, 0) < 0) return std::nullopt;
  alignas(8) std::array<char, kReplySize> reply{};
  const NTSTATUS status =
      calls.query(duplicate.Get(), kObjectTypeInformation, reply.data(), static_cast<ULONG>(reply.size()), nullptr);
  if (status < 0) {
    LOG_TRACE(kScope, L"Erorr m_ntQueryObject");
    return std::nullopt;
  }
  const auto name =
      LeadingCountedString({reply.data(), reply.size()}, static_cast<uint64_t>(reinterpret_cast<uintptr_t>(&reply)));
  if (!name) {
    LOG_ERROR(kScope, L"the type of handle %#x lies outside of the reply", static_cast<unsigned>(value));
    return std::nullopt;
  }
  return std::wstring(name->begin(), name->end());
}

// Shared by the reader and the thread that asks; the thread keeps it alive when it is given up.
struct Job {
  ObjectCalls calls;
  std::shared_ptr<const KernelHandle> process;
  std::vector<uint16_t> values;
  std::vector<std::optional<std::wstring>> types;  // those before `done` are the reader's, the others the thread's
  std::atomic<size_t> done{0};
  std::atomic<bool> isGivenUp{false};
  KernelHandle finished{CreateEventW(nullptr, TRUE, FALSE, nullptr)};

  void Run() noexcept {
    for (size_t i = 0; i < values.size() && !isGivenUp; ++i) {
      types[i] = TypeOf(calls, process->Get(), values[i]);
      done.store(i + 1, std::memory_order_release);
    }
    SetEvent(finished.Get());
  }
};

// How many handles were answered when the thread finished, or made no step for the limit.
size_t Await(Job& job, std::chrono::milliseconds limit) {
  for (size_t before = 0;;) {
    const bool isFinished = WaitForSingleObject(job.finished.Get(), static_cast<DWORD>(limit.count())) == WAIT_OBJECT_0;
    const size_t done = job.done.load(std::memory_order_acquire);
    if (isFinished) return done;
    if (done == before) {
      job.isGivenUp = true;
      NoteAbandonedThread();
      return done;
    }
    before = done;
  }
}

}  // namespace

std::vector<std::optional<std::wstring>> HandleTypeReader::Read(KernelHandle process,
                                                                std::span<const uint16_t> values) {
  std::vector<std::optional<std::wstring>> types(values.size());
  const auto shared = std::make_shared<const KernelHandle>(std::move(process));
  for (size_t first = 0; first < values.size() && m_givenUp < kMostGivenUp;) {
    const std::span<const uint16_t> rest = values.subspan(first);
    const auto job = std::make_shared<Job>();
    if (!job->finished) {
      LOG_ERROR(kScope, L"no event to wait for handles, error %u", GetLastError());
      return types;
    }
    job->calls = m_calls;
    job->process = shared;
    job->values.assign(rest.begin(), rest.end());
    job->types.resize(rest.size());
    try {
      std::thread(&Job::Run, job).detach();
    } catch (const std::system_error& error) {
      LOG_ERROR(kScope, L"no thread to ask for handles, error %d", error.code().value());
      return types;
    }
    const size_t done = Await(*job, m_limit);
    for (size_t i = 0; i < done; ++i)
      types[first + i] = std::move(job->types[i]);
    first += done;
    if (first == values.size()) break;
    LOG_ERROR(kScope, L"handle %#x does not answer and is given up", static_cast<unsigned>(values[first]));
    ++first;
    if (++m_givenUp == kMostGivenUp) LOG_ERROR(kScope, L"too many handles do not answer; no more are asked");
  }
  return types;
}

}  // namespace systeminfo

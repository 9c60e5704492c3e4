// The product's part of the shared control block, for tests: components that have registered. The block's name is one
// for the whole session, so only one of them lives at a time; the next one waits.
#pragma once

#include <windows.h>

#include <cstring>
#include <stdexcept>
#include <string>
#include <vector>

#include "core/scoped.h"
#include "stutil/control_block.h"

class ControlBlockUser {
 public:
  struct Registered {
    const char* name;
    uint32_t level;
  };

  explicit ControlBlockUser(const std::vector<Registered>& components)
      : m_turn(CreateMutexW(nullptr, FALSE, L"st_test_control_block")) {
    WaitForSingleObject(m_turn.Get(), INFINITE);
    m_mapping.Reset(CreateFileMappingW(INVALID_HANDLE_VALUE, nullptr, PAGE_READWRITE, 0, sizeof(stutil::ControlBlock),
                                       stutil::kControlBlockName));
    m_block = static_cast<stutil::ControlBlock*>(MapViewOfFile(m_mapping.Get(), FILE_MAP_ALL_ACCESS, 0, 0, 0));
    if (m_block == nullptr) throw std::runtime_error("no control block for the test");
    std::memset(m_block, 0, sizeof *m_block);
    for (const Registered& component : components)
      Register(component);
  }
  ~ControlBlockUser() {
    UnmapViewOfFile(m_block);
    m_mapping.Reset();
    ReleaseMutex(m_turn.Get());
  }
  ControlBlockUser(const ControlBlockUser&) = delete;
  ControlBlockUser& operator=(const ControlBlockUser&) = delete;

  void Register(const Registered& component) {
    stutil::ControlBlock::Component& place = m_block->components[m_block->componentCount++];
    place.level = component.level;
    std::memcpy(place.name, component.name, std::min(std::strlen(component.name), sizeof place.name));
  }

  // Of the first `count` places, registered or not.
  std::vector<uint32_t> Levels(size_t count) const {
    std::vector<uint32_t> levels;
    for (size_t i = 0; i < count; ++i)
      levels.push_back(m_block->components[i].level);
    return levels;
  }
  stutil::ControlBlock& Block() { return *m_block; }

 private:
  KernelHandle m_turn;
  KernelHandle m_mapping;
  stutil::ControlBlock* m_block = nullptr;
};

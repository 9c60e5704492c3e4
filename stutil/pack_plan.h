// How the work of compressing a list of files is cut into jobs for several threads: runs of small files, and pieces of
// big ones. Pure.
#pragma once

#include <cstdint>
#include <span>
#include <vector>

#include "stutil/zip_selection.h"

namespace stutil {

inline constexpr uint64_t kPieceSize = uint64_t{1} << 20;  // a file above it is cut into pieces
inline constexpr uint64_t kRunSize = uint64_t{256} << 10;  // a run of files ends before it grows beyond this …
inline constexpr size_t kRunFiles = 64;                    // … or this

struct PackJob {
  size_t firstFile = 0;
  size_t fileCount = 0;  // 1 for a piece
  uint64_t offset = 0;   // of the piece in its file
  uint64_t length = 0;   // bytes of the piece, 0 for a run
  bool isPiece = false;
  bool isLastPiece = false;

  bool operator==(const PackJob&) const = default;
};

// Every byte of every file once, in order. No job has more bytes than kPieceSize.
std::vector<PackJob> PlanJobs(std::span<const FileRecord> files);

}  // namespace stutil

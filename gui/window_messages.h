// What the program itself tells the user, in a box of the system's, when there is no page to tell it. The texts are
// those of the English catalogue, by which the other languages' are found.
#pragma once

namespace qx {

inline constexpr wchar_t kPageFailedText[] =
    L"The support tool cannot show its window. It needs all of its own files, and Microsoft Edge, Google Chrome or "
    L"Chromium on this computer. Its log says what is missing.";

inline constexpr wchar_t kPageLostText[] =
    L"The support tool's window has stopped working and is closed. Recording is switched off. If your report was not "
    L"finished, start the support tool again.";

}  // namespace qx

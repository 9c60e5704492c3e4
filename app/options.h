// The one list of what the command line understands. The modes and the run parameters read their options by these rows,
// the warnings know them as the known names, and docs/command_line.md shows them. Portable and pure.
#pragma once

#include <string>
#include <vector>

#include "app/command_line.h"

enum class OptionKind {
  kWord,    // chooses a mode or a job; a value is ignored
  kText,    // NAME=VALUE
  kSwitch,  // NAME turns it on, noNAME off; a value is ignored
};

struct Option {
  const wchar_t* name;
  const wchar_t* shortName;  // empty when there is none
  OptionKind kind;
  const wchar_t* help;
};

namespace options {

inline constexpr Option kNoGui{L"nogui", L"", OptionKind::kWord, L"Runs without a window; needs collect or decrypt."};
inline constexpr Option kSilent{L"silent", L"", OptionKind::kWord, L"The same as nogui."};
inline constexpr Option kMonitoring{L"monitoring", L"m", OptionKind::kWord,
                                    L"Watches counters as monitoring.json says."};
inline constexpr Option kCollect{L"collect", L"c", OptionKind::kWord, L"Collects, packs, encrypts and submits."};
inline constexpr Option kDecrypt{L"decrypt", L"d", OptionKind::kWord, L"Opens a package with a private key."};
inline constexpr Option kSettings{L"settings", L"s", OptionKind::kText, L"The collection settings file."};
inline constexpr Option kPublicKey{L"publicKey", L"pk", OptionKind::kText,
                                   L"collect: logged only; the built-in key encrypts."};
inline constexpr Option kOut{L"out", L"o", OptionKind::kText,
                             L"collect: the output folder; decrypt: the archive to write."};
inline constexpr Option kCompress{L"compress", L"z", OptionKind::kSwitch,
                                  L"Logged only; the archive is always written."};
inline constexpr Option kEncrypt{L"encrypt", L"e", OptionKind::kSwitch, L"Encrypts the archive into a package."};
inline constexpr Option kPrettyPrint{L"prettyPrint", L"pp", OptionKind::kSwitch,
                                     L"Indents the collected files, when no settings file is used."};
inline constexpr Option kDeleteTemporaryFolder{L"deleteTemporaryFolder", L"dtf", OptionKind::kSwitch,
                                               L"Deletes the output folder when the run ends."};
inline constexpr Option kDeleteArchive{L"deleteArchive", L"da", OptionKind::kSwitch,
                                       L"Deletes the archive when the run ends."};
inline constexpr Option kCloudSubmit{L"cloudSubmit", L"cs", OptionKind::kSwitch, L"Submits the package."};
inline constexpr Option kPrivateKey{L"privateKey", L"pk", OptionKind::kText, L"decrypt: the private key file."};
inline constexpr Option kIn{L"in", L"i", OptionKind::kText, L"decrypt: the package to read."};

inline constexpr Option kAll[] = {
    kNoGui,         kSilent,      kMonitoring, kCollect, kDecrypt,     kSettings,
    kPublicKey,     kOut,         kCompress,   kEncrypt, kPrettyPrint, kDeleteTemporaryFolder,
    kDeleteArchive, kCloudSubmit, kPrivateKey, kIn,
};

}  // namespace options

// The word's long or short name is present.
bool IsGiven(const ArgumentMap& arguments, const Option& word);

// Sets `field` to the first value of the option when it is present. Given both ways, the short name wins; a present
// name without "=" makes the field empty.
void ReadText(const ArgumentMap& arguments, const Option& text, std::wstring& field);

// Sets `field` when the switch is present. Tested in the order long, "no" + long, short, "no" + short; each later hit
// overrides the earlier ones, whatever their order on the command line.
void ReadSwitch(const ArgumentMap& arguments, const Option& option, bool& field);

enum class Mode { kNoGui, kMonitoring, kGui };

// "nogui" or "silent" beat "m" or "monitoring"; without any of them there is a window.
Mode SelectMode(const ArgumentMap& arguments);

// One line for each element that will not do what its writer meant: a name that no option has (with the nearest known
// name), a value given to an option that ignores it, an element that is no argument. The elements as for
// ParseCommandLine; not for an empty command line, where the system makes up the program's path as an element.
std::vector<std::wstring> CommandLineWarnings(int count, const wchar_t* const* elements);

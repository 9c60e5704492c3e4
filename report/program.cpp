#include "report/program.h"

#include <exception>
#include <memory>
#include <optional>

#include "core/files.h"
#include "core/text.h"
#include "report/archive.h"
#include "report/arguments.h"
#include "report/extraction.h"
#include "report/findings_output.h"
#include "report/loading.h"
#include "report/rules.h"

namespace report {
namespace {

constexpr char kNoCollection[] =
    " holds no collection: neither a manifest nor any file of a collector is in it. Is it a package of the support "
    "tool?";

ProgramOutput Failure(ExitCode code, std::string_view message) {
  return {"", "support_report: " + Printable(message) + "\n", code};
}

ProgramOutput Judge(const Arguments& arguments, const std::optional<Collection>& collection) {
  if (!collection) return Failure(ExitCode::kBadInput, ToUtf8(arguments.input) + kNoCollection);
  const std::vector<Finding> findings = FindAll(*collection);
  return {arguments.asJson ? FindingsAsJson(findings) : FindingsAsText(findings), "",
          findings.empty() ? ExitCode::kNothingFound : ExitCode::kFindings};
}

// Adds a message for each entry that cannot be written.
void Extract(const Archive& archive, const Arguments& arguments, ProgramOutput& output) {
  if (const std::string fault = PrepareFolder(arguments.extractFolder); !fault.empty()) {
    output = Failure(ExitCode::kBadInput, fault);
    return;
  }
  for (const Evidence& entry : archive.LeftOut())
    output.messages += "support_report: left out: " + Printable(entry.file + ": " + entry.text) + "\n";
  for (const Evidence& entry : ExtractArchive(archive, arguments.extractFolder)) {
    output.messages += "support_report: not unpacked: " + Printable(entry.file + ": " + entry.text) + "\n";
    output.code = ExitCode::kBadInput;
  }
}

ProgramOutput OpenFolder(const Arguments& arguments) {
  if (!arguments.extractFolder.empty()) {
    return Failure(ExitCode::kBadInput, ToUtf8(arguments.input) + " is a folder: leave --extract out.");
  }
  return Judge(arguments, LoadCollection(arguments.input));
}

ProgramOutput OpenArchive(const Arguments& arguments) {
  std::string bytes;
  std::string message;
  const ExitCode code = ReadArchiveBytes(arguments.input, arguments.keyFile, bytes, message);
  if (code != ExitCode::kNothingFound) return Failure(code, message);
  const std::unique_ptr<Archive> archive = Archive::Open(bytes, message);
  if (!archive) return Failure(ExitCode::kBadInput, ToUtf8(arguments.input) + " " + message + ". Ask for it again.");
  ProgramOutput output = Judge(arguments, LoadCollection(*archive));
  if (!arguments.extractFolder.empty()) Extract(*archive, arguments, output);
  return output;
}

}  // namespace

ProgramOutput RunProgram(const std::vector<std::wstring>& elements) {
  try {
    Arguments arguments;
    if (const std::string fault = ParseArguments(elements, arguments); !fault.empty()) {
      return Failure(ExitCode::kBadInput, fault + " --help says more.");
    }
    if (arguments.showHelp) return {HelpText(), "", ExitCode::kNothingFound};
    if (arguments.showVersion) return {"support_report " ST_VERSION "\n", "", ExitCode::kNothingFound};
    return FolderExists(arguments.input) ? OpenFolder(arguments) : OpenArchive(arguments);
  } catch (const std::exception& exception) {
    return Failure(ExitCode::kBadInput, std::string("the package cannot be opened: ") + exception.what());
  }
}

}  // namespace report

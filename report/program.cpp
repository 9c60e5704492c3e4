#include "report/program.h"

#include <exception>
#include <memory>
#include <optional>

#include "core/files.h"
#include "core/paths.h"
#include "core/text.h"
#include "report/arguments.h"
#include "report/data_document.h"
#include "report/extraction.h"
#include "report/findings_output.h"
#include "report/opened_input.h"
#include "report/report_page.h"
#include "report/rules.h"
#include "report/tables/table_list.h"

namespace report {
namespace {

constexpr char kNoCollection[] =
    " holds no collection: neither a manifest nor any file of a collector is in it. Is it a package of the support "
    "tool?";

ProgramOutput Failure(ExitCode code, std::string_view message) {
  return {"", "support_report: " + Printable(message) + "\n", code};
}

// One collection, with what a report or a comparison needs of it.
struct Side {
  OpenedInput input;
  std::vector<Table> tables = {};

  const Collection& GetCollection() const { return *input.GetCollection(); }
};

ReportSource SourceOf(const std::wstring& path, const OpenedInput& input) {
  return {ToUtf8(LastPathComponent(path)), input.Size()};
}

// Nothing when the report may be written: it must not replace what it was made of.
std::string OutputFault(const Arguments& arguments) {
  const std::wstring output = ExtendedPath(arguments.reportFile);
  for (const std::wstring* input : {&arguments.input, &arguments.other, &arguments.keyFile}) {
    const std::wstring path = ExtendedPath(*input);
    if (!path.empty() && CompareStringOrdinal(output.c_str(), -1, path.c_str(), -1, TRUE) == CSTR_EQUAL) {
      return "-o names " + ToUtf8(*input) + ", which is read. Name another file for the report.";
    }
  }
  if (FolderExists(arguments.reportFile)) {
    return ToUtf8(arguments.reportFile) + " is a folder. Name a file for the report.";
  }
  return {};
}

// Opens one of the collections; its failure is the output.
std::optional<ProgramOutput> OpenSide(const std::wstring& path, const Arguments& arguments, Side& side) {
  std::string message;
  const ExitCode code = side.input.Open(path, arguments.keyFile, message);
  if (code != ExitCode::kNothingFound) return Failure(code, message);
  if (!side.input.GetCollection()) return Failure(ExitCode::kBadInput, ToUtf8(path) + kNoCollection);
  return std::nullopt;
}

// Writes the report; a fault replaces the output.
void WriteReport(const Arguments& arguments, Side& side, const std::vector<Finding>& findings,
                 const ComparedWith* compared, ProgramOutput& output) {
  const std::string html =
      EmbedData(ReportPage(), DataDocument(side.GetCollection(), SourceOf(arguments.input, side.input), findings,
                                           std::move(side.tables), compared));
  if (html.empty()) {
    output = Failure(ExitCode::kBadInput, "this program was built without the report's page: install it again.");
    return;
  }
  if (const DWORD error = WriteWholeFile(arguments.reportFile, html); error != ERROR_SUCCESS) {
    output = Failure(ExitCode::kBadInput, ToUtf8(arguments.reportFile) + " cannot be written, error " +
                                              std::to_string(error) +
                                              ". Name a file in a folder that is there and may be written to.");
    return;
  }
  if (!arguments.asJson) {
    output.text = Printable(ToUtf8(arguments.reportFile)) + " is written. Findings: " + std::to_string(findings.size());
    if (compared != nullptr) output.text += ", changes: " + std::to_string(compared->comparison.count);
    output.text += ".\n";
  }
}

ProgramOutput Judge(const Arguments& arguments, Side& side, const Progress& progress) {
  Side other;
  std::optional<Comparison> comparison;
  if (!arguments.other.empty()) {
    progress("Opening the other collection");
    if (auto failure = OpenSide(arguments.other, arguments, other)) return *failure;
    other.tables = MakeTables(other.GetCollection());
  }
  progress("Judging");
  const std::vector<Finding> findings = FindAll(side.GetCollection());
  if (!arguments.reportFile.empty() || !arguments.other.empty()) side.tables = MakeTables(side.GetCollection());
  if (!arguments.other.empty()) {
    comparison = Compare({side.GetCollection(), side.tables}, {other.GetCollection(), other.tables});
  }
  const Comparison* const compared = comparison ? &*comparison : nullptr;
  ProgramOutput output{"", "", findings.empty() ? ExitCode::kNothingFound : ExitCode::kFindings};
  const bool isTextWanted = arguments.asJson || arguments.reportFile.empty();
  if (isTextWanted) {
    output.text = arguments.asJson ? FindingsAsJson(findings, compared) : FindingsAsText(findings, compared);
  }
  if (!arguments.reportFile.empty()) {
    progress("Writing the report");
    const auto with =
        comparison ? std::optional(ComparedWith{*comparison, SourceOf(arguments.other, other.input)}) : std::nullopt;
    WriteReport(arguments, side, findings, with ? &*with : nullptr, output);
  }
  return output;
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

ProgramOutput Run(const Arguments& arguments, const Progress& progress) {
  if (!arguments.extractFolder.empty() && FolderExists(arguments.input)) {
    return Failure(ExitCode::kBadInput, ToUtf8(arguments.input) + " is a folder: leave --extract out.");
  }
  if (!arguments.reportFile.empty()) {
    if (const std::string fault = OutputFault(arguments); !fault.empty()) return Failure(ExitCode::kBadInput, fault);
  }
  progress("Opening");
  Side side;
  const auto failure = OpenSide(arguments.input, arguments, side);
  ProgramOutput output = failure ? *failure : Judge(arguments, side, progress);
  if (!arguments.extractFolder.empty() && side.input.GetArchive() != nullptr) {
    progress("Unpacking");
    Extract(*side.input.GetArchive(), arguments, output);
  }
  return output;
}

}  // namespace

ProgramOutput RunProgram(const std::vector<std::wstring>& elements, const Progress& progress) {
  try {
    Arguments arguments;
    if (const std::string fault = ParseArguments(elements, arguments); !fault.empty()) {
      return Failure(ExitCode::kBadInput, fault + " --help says more.");
    }
    if (arguments.showHelp) return {HelpText(), "", ExitCode::kNothingFound};
    if (arguments.showVersion) return {"support_report " ST_VERSION "\n", "", ExitCode::kNothingFound};
    return Run(arguments, progress);
  } catch (const std::exception& exception) {
    return Failure(ExitCode::kBadInput, std::string("the package cannot be opened: ") + exception.what());
  }
}

}  // namespace report

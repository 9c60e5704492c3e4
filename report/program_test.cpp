#include "report/program.h"

#include <gmock/gmock.h>

#include "core/files.h"
#include "core/json.h"
#include "report/arguments.h"
#include "stutil/development_keys.h"
#include "stutil/package.h"
#include "tests/support/crafted_zip.h"
#include "tests/support/test_folder.h"

namespace report {
namespace {

using testing::HasSubstr;

const std::vector<CraftedEntry> kFailed = {
    {"collected/collection_manifest.json",
     R"({"collectors": [{"name": "x", "outcome": "failed", "reason": "\u001b[2J"}]})"}};

std::string Package(const std::string& archive) {
  std::string package;
  EXPECT_EQ(stutil::EncryptBuffer(development_keys::kPublicKey, archive, package), DWORD{ERROR_SUCCESS});
  return package;
}

TEST(Program, EachKindOfInputHasItsExitCodeAndMessage) {
  const TestFolder folder;
  const std::wstring key = folder.MakeFile(L"key.pem", development_keys::kPrivateKey);
  const std::wstring other = folder.MakeFile(L"other.pem", development_keys::kOtherPrivateKey);
  const std::wstring noKey = folder.MakeFile(L"no.pem", "no key");
  const std::wstring zip = folder.MakeFile(L"a.zip", CraftZip(kFailed));
  const std::wstring quiet = folder.MakeFile(L"quiet.zip", CraftZip({{"collection_manifest.json", "{}"}}));
  const std::wstring logs = folder.MakeFile(L"logs.zip", CraftZip({{"Logs/a.log", "x"}}));
  const std::wstring package = folder.MakeFile(L"package", Package(CraftZip(kFailed)));
  const std::wstring hollow = folder.MakeFile(L"hollow", Package("no archive"));
  const std::wstring garbage = folder.MakeFile(L"garbage", std::string(1000, '\xA5'));
  const std::wstring cutOff = folder.MakeFile(L"cut", CraftZip(kFailed).substr(0, 50));
  const std::wstring empty = folder.MakeFile(L"empty");
  const std::wstring data = folder.MakeFolder(L"data");

  struct Row {
    std::vector<std::wstring> arguments;
    ExitCode code;
    const char* message;
  };
  const Row rows[] = {
      {{package, L"--key", key}, ExitCode::kFindings, ""},
      {{zip}, ExitCode::kFindings, ""},
      {{quiet}, ExitCode::kNothingFound, ""},
      {{package}, ExitCode::kBadInput, "--key FILE"},
      {{package, L"--key", other}, ExitCode::kWrongKey, "does not open the package"},
      {{package, L"--key", noKey}, ExitCode::kWrongKey, "RSA PRIVATE KEY"},
      {{package, L"--key", folder.Path(L"absent")}, ExitCode::kBadInput, "absent cannot be read, error 2"},
      {{hollow, L"--key", key}, ExitCode::kBadInput, "is damaged"},
      {{garbage, L"--key", key}, ExitCode::kBadInput, "neither a package nor a zip archive"},
      {{empty, L"--key", key}, ExitCode::kBadInput, "neither a package nor a zip archive"},
      {{cutOff}, ExitCode::kBadInput, "is no sound zip archive"},
      {{logs}, ExitCode::kBadInput, "holds no collection"},
      {{data}, ExitCode::kBadInput, "holds no collection"},
      {{data, L"--extract", folder.Path(L"x")}, ExitCode::kBadInput, "leave --extract out"},
      {{zip, L"--extract", folder.Path()}, ExitCode::kBadInput, "is not empty"},
      {{folder.Path(L"absent")}, ExitCode::kBadInput, "cannot be read, error 2"},
      {{}, ExitCode::kBadInput, "Name a package"},
      {{zip, L"--nonsense"}, ExitCode::kBadInput, "There is no option --nonsense"},
  };
  for (const Row& row : rows) {
    SCOPED_TRACE(row.message);
    const ProgramOutput output = RunProgram(row.arguments);
    EXPECT_EQ(output.code, row.code);
    EXPECT_THAT(output.messages, HasSubstr(row.message));
    EXPECT_EQ(output.messages.empty(), *row.message == '\0') << output.messages;
    EXPECT_EQ(output.text.empty(), row.code >= ExitCode::kBadInput) << output.text;
  }
}

TEST(Program, FindingsAreTextOrJson) {
  const TestFolder folder;
  const std::wstring zip = folder.MakeFile(L"a.zip", CraftZip(kFailed));
  EXPECT_EQ(RunProgram({zip}).text,
            "warning: A collector failed [collector-failed]\n"
            "  Its file is missing or incomplete.\n"
            "  - collection_manifest.json collectors[0]: x: ?[2J\n"
            "\n"
            "Findings: 1\n");
  Json::Value document;
  std::string error;
  ASSERT_TRUE(ParseJson(RunProgram({L"--json", zip}).text, document, error)) << error;
  const Json::Value& finding = document["findings"][0];
  EXPECT_EQ(finding["id"], "collector-failed");
  EXPECT_EQ(finding["count"], 1);
  EXPECT_EQ(finding["evidence"][0]["text"], "x: \x1B[2J");
}

TEST(Program, AReportReplacesTheTextAndStandsUnderItsNameOnlyWhenItIsWhole) {
  const TestFolder folder;
  const std::wstring zip = folder.MakeFile(L"a.zip", CraftZip(kFailed));
  const std::wstring report = folder.Path(L"r.html");
  std::vector<std::string> steps;
  const ProgramOutput output =
      RunProgram({zip, L"-o", report}, [&](std::string_view step) { steps.emplace_back(step); });
  EXPECT_EQ(output.code, ExitCode::kFindings) << output.messages;
  EXPECT_THAT(output.text, HasSubstr("r.html is written. Findings: 1.\n"));
  EXPECT_THAT(steps, testing::ElementsAre("Opening", "Judging", "Writing the report"));
  std::string html;
  ASSERT_EQ(ReadWholeFile(report, 16 << 20, html), DWORD{ERROR_SUCCESS});
  EXPECT_THAT(html, HasSubstr("\"collector-failed\""));
  EXPECT_THAT(RunProgram({zip, L"-o", report, L"--json"}).text, testing::StartsWith("{"));
  EXPECT_FALSE(PathExists(report + L".partial"));
}

TEST(Program, AReportDoesNotReplaceWhatIsRead) {
  const TestFolder folder;
  const std::wstring zip = folder.MakeFile(L"a.zip", CraftZip(kFailed));
  const std::wstring other = folder.MakeFile(L"b.zip", CraftZip(kFailed));
  const struct {
    std::vector<std::wstring> arguments;
    const char* message;
  } rows[] = {
      {{zip, L"-o", folder.Path(L"x\\..\\A.ZIP")}, "which is read"},
      {{zip, L"--compare", other, L"-o", other}, "which is read"},
      {{zip, L"-o", folder.Path()}, "is a folder"},
      {{zip, L"-o", folder.Path(L"absent\\r.html")}, "cannot be written, error 3"},
      {{zip, L"--compare", folder.Path(L"absent")}, "absent cannot be read, error 2"},
  };
  for (const auto& row : rows) {
    const ProgramOutput output = RunProgram(row.arguments);
    EXPECT_EQ(output.code, ExitCode::kBadInput) << row.message;
    EXPECT_THAT(output.messages, HasSubstr(row.message));
    EXPECT_EQ(output.text, "");
  }
  std::string bytes;
  ReadWholeFile(zip, 1 << 20, bytes);
  EXPECT_EQ(bytes, CraftZip(kFailed));
}

TEST(Program, UnpacksAndTellsWhatItLeftOut) {
  const TestFolder folder;
  std::vector<CraftedEntry> entries = kFailed;
  entries.push_back({"../evil", "x"});
  const std::wstring zip = folder.MakeFile(L"a.zip", CraftZip(entries));
  const ProgramOutput output = RunProgram({zip, L"--extract", folder.Path(L"out")});
  EXPECT_EQ(output.code, ExitCode::kFindings);
  EXPECT_THAT(output.messages, HasSubstr("left out: ../evil: leads out of its folder"));
  EXPECT_THAT(output.text, HasSubstr("[entry-left-out]"));
  EXPECT_TRUE(PathExists(folder.Path(L"out\\collected\\collection_manifest.json")));
  EXPECT_FALSE(PathExists(folder.Path(L"evil")));
}

TEST(ReportArguments, AreUnderstoodInAnyOrder) {
  Arguments arguments;
  EXPECT_EQ(
      ParseArguments({L"--json", L"--key", L"--k", L"--extract", L"x", L"-o", L"r", L"--compare", L"c", L"--", L"--p"},
                     arguments),
      "");
  EXPECT_EQ(arguments, (Arguments{L"--p", L"--k", L"x", L"c", L"r", true}));
  arguments = {};
  EXPECT_EQ(ParseArguments({L"--help"}, arguments), "");
  EXPECT_THAT(ParseArguments({L"a", L"b"}, arguments), HasSubstr("Only one package"));
  arguments = {};
  EXPECT_THAT(ParseArguments({L"a", L"--key"}, arguments), HasSubstr("--key needs"));
}

}  // namespace
}  // namespace report

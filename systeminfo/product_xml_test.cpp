#include "systeminfo/product_xml.h"

#include <gmock/gmock.h>
#include <json/writer.h>

namespace systeminfo {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

TEST(ProductXml, DumpPathIsTheTextOfItsElement) {
  struct {
    std::string xml;
    XmlOutcome outcome;
    const char* text;
  } const rows[] = {
      {"<settings><qxreinit><DumpPath>%TEMP%\\d</DumpPath></qxreinit></settings>", XmlOutcome::kFound, "%TEMP%\\d"},
      {"\xEF\xBB\xBF<?xml version='1.0'?><settings><a/><qxreinit><b/><DumpPath>\n D:\\a &amp; b "
       "\n</DumpPath></qxreinit>"
       "</settings>",
       XmlOutcome::kFound, "D:\\a & b"},
      {"<settings><qxreinit><DumpPath/></qxreinit></settings>", XmlOutcome::kMissing, ""},
      {"<settings><qxreinit><DumpPath> </DumpPath></qxreinit></settings>", XmlOutcome::kMissing, ""},
      {"<settings><qxreinit><DumpPath><a/></DumpPath></qxreinit></settings>", XmlOutcome::kMissing, ""},
      {"<settings><DumpPath>x</DumpPath></settings>", XmlOutcome::kMissing, ""},
      {"<other><qxreinit><DumpPath>x</DumpPath></qxreinit></other>", XmlOutcome::kMissing, ""},
      {"", XmlOutcome::kNotXml, ""},
      {"{\"DumpPath\": \"x\"}", XmlOutcome::kNotXml, ""},
      {"<settings><qxreinit><DumpPath>x", XmlOutcome::kNotXml, ""},
      {std::string("<\0s\0/\0>\0", 8), XmlOutcome::kNotXml, ""},
  };
  for (const auto& row : rows) {
    const DumpPathText path = ParseDumpPath(row.xml);
    EXPECT_EQ(path.outcome, row.outcome) << row.xml;
    EXPECT_EQ(path.text, row.text) << row.xml;
  }
}

TEST(ProductXml, UpdateTimesStandUnderTheNamesOfTheElements) {
  const UpdateStatistics statistics = ParseUpdateStatistics(
      "<UpdateStatistics><Signatures><Check time='1700000000' x='y'/><Update time=''/></Signatures>text<!-- c -->"
      "<Product><Update time='later'/><Check time='first'/></Product></UpdateStatistics>");
  EXPECT_EQ(statistics.outcome, XmlOutcome::kFound);
  Json::Value expected;
  expected["Signatures"]["check"]["time"] = "1700000000";
  expected["Signatures"]["update"]["time"] = "";
  expected["Product"]["check"]["time"] = "first";
  expected["Product"]["update"]["time"] = "later";
  EXPECT_EQ(statistics.elements, expected);
  EXPECT_THAT(statistics.invalidElements, IsEmpty());
  EXPECT_THAT(statistics.missingTimes, IsEmpty());
}

TEST(ProductXml, IncompleteUpdateElementsLoseOnlyThemselves) {
  const UpdateStatistics statistics = ParseUpdateStatistics(
      "<UpdateStatistics><NoCheck><Update time='1'/></NoCheck><NoUpdate><Check time='1'/></NoUpdate><Empty/>"
      "<NoTime><Check/><Update time='2'/></NoTime><Good><Check time='3'/><Update time='4'/></Good></UpdateStatistics>");
  Json::Value expected;
  expected["NoTime"]["check"]["time"] = Json::Value();
  expected["NoTime"]["update"]["time"] = "2";
  expected["Good"]["check"]["time"] = "3";
  expected["Good"]["update"]["time"] = "4";
  EXPECT_EQ(statistics.elements, expected);
  EXPECT_THAT(statistics.invalidElements, ElementsAre("NoCheck", "NoUpdate", "Empty"));
  EXPECT_THAT(statistics.missingTimes, ElementsAre("NoTime/Check"));
}

TEST(ProductXml, HostileDocumentsEndQuickly) {
  std::string nested;
  for (int i = 0; i < 100'000; ++i)
    nested += "<a>";
  std::string bomb = "<!DOCTYPE UpdateStatistics [<!ENTITY a0 'aaaaaaaaaa'>";
  for (int i = 1; i < 30; ++i) {
    bomb.append("<!ENTITY a").append(std::to_string(i)).append(" '");
    for (int copy = 0; copy < 3; ++copy)
      bomb.append("&a").append(std::to_string(i - 1)).append(";");
    bomb += "'>";
  }
  bomb += "]><UpdateStatistics><S><Check time='&a29;'/><Update time='1'/></S></UpdateStatistics>";
  EXPECT_EQ(ParseUpdateStatistics(nested).outcome, XmlOutcome::kNotXml);
  EXPECT_EQ(ParseDumpPath(nested).outcome, XmlOutcome::kNotXml);
  // Entities of a document's own are never replaced, so that they cannot grow.
  EXPECT_LT(ParseUpdateStatistics(bomb).elements.toStyledString().size(), 1000u);
  EXPECT_EQ(ParseUpdateStatistics("<root/>").outcome, XmlOutcome::kMissing);
  EXPECT_EQ(ParseUpdateStatistics("UpdateStatistics").outcome, XmlOutcome::kNotXml);
}

}  // namespace
}  // namespace systeminfo

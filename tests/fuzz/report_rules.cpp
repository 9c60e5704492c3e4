// A collection's documents, judged by the rules. The first line of an input names the document.
#include "core/json.h"
#include "report/findings_output.h"
#include "report/rules.h"
#include "tests/fuzz/fuzz.h"

void FuzzOne(std::string_view bytes) {
  report::Collection collection;
  Input input(bytes);
  while (!input.IsEmpty()) {
    const std::string name(input.TakeLine());
    const std::string_view text = input.Rest().substr(0, input.Rest().find('\f'));
    if (report::IsDocumentName(name)) report::AddDocument(collection, name, text);
    collection.files.push_back({name, text.size()});
    input = Input(input.Rest().substr(std::min(text.size() + 1, input.Rest().size())));
  }
  report::SetCollectionTime(collection);
  const auto findings = report::FindAll(collection);
  Json::Value document;
  std::string error;
  PROMISE(ParseJson(report::FindingsAsJson(findings), document, error));
  PROMISE(document["findings"].size() == findings.size());
  const std::string shown = report::FindingsAsText(findings);
  PROMISE(std::all_of(shown.begin(), shown.end(), [](unsigned char c) { return c >= ' ' || c == '\n' || c == '\r'; }));
}

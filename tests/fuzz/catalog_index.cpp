// The subject identifiers of a catalog. Each begins with its length and its form.
#include "systeminfo/catalog_index.h"

#include "tests/fuzz/fuzz.h"

void FuzzOne(std::string_view bytes) {
  CatalogHashIndex index;
  std::vector<std::string> hashes;
  index.AddHash("no catalog yet");
  for (Input input(bytes); !input.IsEmpty();) {
    const auto head = input.Take<uint8_t>();
    if (head == 0xFF || index.Catalogs() == 0) index.AddCatalog(std::to_wstring(index.Catalogs()));
    const std::string_view identifier = input.Rest().substr(0, head & 0x7F);
    const SubjectForm form = head > 0x7F ? SubjectForm::kHexText : SubjectForm::kBytes;
    hashes.push_back(SubjectHash(identifier, form));
    PROMISE(hashes.back().size() == (form == SubjectForm::kBytes ? identifier.size() : identifier.size() / 4));
    index.AddHash(hashes.back());
    input = Input(input.Rest().substr(identifier.size()));
  }
  index.Sort();
  PROMISE(index.Hashes() == hashes.size());
  for (const std::string& hash : hashes)
    PROMISE(index.Find(hash) != nullptr);
  PROMISE(index.Find(std::string(200, 'x')) == nullptr);
  SubjectFormOf(bytes);
}

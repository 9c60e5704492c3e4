#include "systeminfo/variant_to_json.h"

#include "core/com.h"
#include "core/logging.h"
#include "core/text.h"

namespace {

Json::Value Untreated(VARTYPE type) {
  LOG_WARNING(L"VariantToJsonValue", L"Untreated variant type=%hu", type);
  return {};
}

// The count is the size of an element, not the bound, and the holder is not reset between reads, so that an index
// beyond the end yields the last string once more. Kept on purpose; a collector that needs the real elements must not
// come here.
Json::Value StringArray(SAFEARRAY* array) {
  Json::Value strings(Json::arrayValue);
  if (array == nullptr) return strings;
  // An element of an array of more dimensions is read with more indices than the one below.
  if (SafeArrayGetDim(array) != 1) return Untreated(VT_ARRAY | VT_BSTR);
  ScopedBstr holder;
  const ULONG count = array->cbElements;
  for (ULONG i = 0; i < count; ++i) {
    LONG index = static_cast<LONG>(i);
    ScopedBstr element;
    if (SUCCEEDED(SafeArrayGetElement(array, &index, element.Receive()))) holder = std::move(element);
    strings.append(ToUtf8(BstrText(holder.Get())));
  }
  return strings;
}

}  // namespace

Json::Value VariantToJsonValue(const VARIANT& variant) {
  switch (variant.vt) {
    case VT_EMPTY:
    case VT_NULL:
      return {};
    case VT_I2:
      return Json::Value(Json::Int{variant.uiVal});
    case VT_I4:
      return Json::Value(Json::UInt{variant.ulVal});
    case VT_BOOL:
      return Json::Value(Json::Int{variant.boolVal});
    case VT_UI1:
      return Json::Value(Json::Int{variant.iVal});
    case VT_BSTR:
      return Json::Value(ToUtf8(BstrText(variant.bstrVal)));
    case VT_ARRAY | VT_BSTR:
      return StringArray(variant.parray);
    default:
      return Untreated(variant.vt);
  }
}

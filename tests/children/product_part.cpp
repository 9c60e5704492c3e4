// A library of the staged product: only its version resource matters.
extern "C" __declspec(dllexport) int ProductPart() {
  return 0;
}

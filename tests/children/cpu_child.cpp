// Keeps one processor busy until it is ended, or for the number of seconds that it is given.
#include <windows.h>

#include <cstdlib>

int main(int count, char** arguments) {
  const ULONGLONG limit = count > 1 ? std::strtoull(arguments[1], nullptr, 10) * 1000 : ~0ULL;
  const ULONGLONG begin = GetTickCount64();
  volatile unsigned work = 0;
  while (GetTickCount64() - begin < limit) {
    for (unsigned i = 0; i < 100'000; ++i)
      work = work + i;
  }
  return 0;
}

# Clang for the machine that builds, with its sanitizers and the instructions that a fuzzer follows: tests/native and the
# libraries that it links. Undefined behaviour is looked for in our own sources only (tests/native/CMakeLists.txt).
set(CMAKE_C_COMPILER clang)
set(CMAKE_CXX_COMPILER clang++)

set(ST_SANITIZERS "-fsanitize=address,fuzzer-no-link -fno-omit-frame-pointer -gline-tables-only")
set(CMAKE_C_FLAGS_INIT "${ST_SANITIZERS}")
set(CMAKE_CXX_FLAGS_INIT "${ST_SANITIZERS}")

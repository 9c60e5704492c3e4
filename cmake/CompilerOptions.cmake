# Warnings, hardening and the Windows version for every target of ours, as the interface target `st_options`.
add_library(st_options INTERFACE)
target_compile_features(st_options INTERFACE cxx_std_20)
target_include_directories(st_options INTERFACE ${PROJECT_SOURCE_DIR})
target_compile_definitions(st_options INTERFACE
  UNICODE _UNICODE NOMINMAX WIN32_LEAN_AND_MEAN
  WINVER=0x0A00 _WIN32_WINNT=0x0A00)

if(MSVC)
  target_compile_options(st_options INTERFACE /W4 /WX /permissive- /utf-8 /sdl /guard:cf /Zc:__cplusplus)
  target_link_options(st_options INTERFACE /guard:cf /DYNAMICBASE /HIGHENTROPYVA /NXCOMPAT)
else()
  target_compile_options(st_options INTERFACE -Wall -Wextra -Werror -Wshadow -fstack-protector-strong)
  # _FORTIFY_SOURCE needs an optimised build; the assertions of the C++ library stay on in every build.
  target_compile_definitions(st_options INTERFACE
    _GLIBCXX_ASSERTIONS $<$<NOT:$<CONFIG:Debug>>:_FORTIFY_SOURCE=2>)
  # In what ships too: tests and benchmarks run what ships. The processor has no alignment faults, and records of files
  # are read in place.
  if(ST_UNDEFINED_TRAPS)
    target_compile_options(st_options INTERFACE
      -fsanitize=undefined -fno-sanitize=alignment -fsanitize-undefined-trap-on-error)
  endif()
  # -static: no run-time library of the compiler has to lie beside the program.
  target_link_options(st_options INTERFACE -static -fstack-protector-strong
    -Wl,--dynamicbase -Wl,--high-entropy-va -Wl,--nxcompat)
endif()

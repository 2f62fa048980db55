# What every target of the project is compiled and linked with.
add_library(kz7_options INTERFACE)
target_include_directories(kz7_options INTERFACE ${PROJECT_SOURCE_DIR})
target_compile_features(kz7_options INTERFACE cxx_std_20)

if(KZ7_WARNINGS)
  target_compile_options(kz7_options INTERFACE -Wall -Wextra -Wpedantic -Wshadow -Wconversion -Wformat=2 -Wundef)
  # gcc 12 sees overlaps in its own std::string concatenation at -O3.
  target_compile_options(kz7_options INTERFACE $<$<CXX_COMPILER_ID:GNU>:-Wno-restrict>)
endif()
if(KZ7_WERROR)
  target_compile_options(kz7_options INTERFACE -Werror)
endif()

if(KZ7_SANITIZERS)
  target_compile_options(kz7_options INTERFACE -fsanitize=${KZ7_SANITIZERS} -fno-sanitize-recover=all -fno-omit-frame-pointer)
  target_link_options(kz7_options INTERFACE -fsanitize=${KZ7_SANITIZERS})
endif()

if(KZ7_FUZZ)
  target_compile_options(kz7_options INTERFACE -fsanitize=fuzzer-no-link)
endif()

if(WIN32)
  # The programs need nothing installed beside them.
  target_compile_definitions(kz7_options INTERFACE NOMINMAX WIN32_LEAN_AND_MEAN _WIN32_WINNT=0x0601)
  target_link_options(kz7_options INTERFACE -static)
elseif(NOT KZ7_SANITIZERS)
  # A dynamic C++ start costs half a millisecond more; a fully static program could not load a level library.
  target_link_options(kz7_options INTERFACE -static-libstdc++ -static-libgcc)
endif()

# CLI11 is header only and lies in the host's own include folder, which a cross compiler must never see: only
# its folder is linked into the build tree.
find_path(KZ7_CLI11_FOLDER CLI/CLI.hpp PATHS /usr/include NO_DEFAULT_PATH NO_CMAKE_FIND_ROOT_PATH REQUIRED)
file(MAKE_DIRECTORY ${PROJECT_BINARY_DIR}/cli11)
file(CREATE_LINK ${KZ7_CLI11_FOLDER}/CLI ${PROJECT_BINARY_DIR}/cli11/CLI SYMBOLIC)
add_library(kz7_cli11 INTERFACE)
target_include_directories(kz7_cli11 SYSTEM INTERFACE ${PROJECT_BINARY_DIR}/cli11)

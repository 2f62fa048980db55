# Compile and link options of every target of the project.
add_library(kz7_options INTERFACE)
target_include_directories(kz7_options INTERFACE ${PROJECT_SOURCE_DIR})
target_compile_features(kz7_options INTERFACE cxx_std_20)

if(KZ7_WARNINGS)
  target_compile_options(kz7_options INTERFACE -Wall -Wextra -Wpedantic -Wshadow -Wconversion -Wformat=2 -Wundef)
  # gcc 12 reports overlaps in its own std::string concatenation at -O3.
  target_compile_options(kz7_options INTERFACE $<$<CXX_COMPILER_ID:GNU>:-Wno-restrict>)
endif()
if(KZ7_WERROR)
  target_compile_options(kz7_options INTERFACE -Werror)
endif()

if(KZ7_SANITIZERS)
  target_compile_options(kz7_options INTERFACE -fsanitize=${KZ7_SANITIZERS} -fno-sanitize-recover=all -fno-omit-frame-pointer)
  # With sanitizers gcc takes members of std::regex for uninitialized.
  target_compile_options(kz7_options INTERFACE $<$<CXX_COMPILER_ID:GNU>:-Wno-maybe-uninitialized>)
  target_link_options(kz7_options INTERFACE -fsanitize=${KZ7_SANITIZERS})
endif()

if(KZ7_FUZZ)
  target_compile_options(kz7_options INTERFACE -fsanitize=fuzzer-no-link)
endif()

if(WIN32)
  target_compile_definitions(kz7_options INTERFACE NOMINMAX WIN32_LEAN_AND_MEAN _WIN32_WINNT=0x0601)
endif()

# The rest is for the programs.
if(NOT KZ7_PROGRAMS)
  return()
endif()

if(WIN32)
  # They need no installed runtime library, and the time of a link is no part of its result.
  target_link_options(kz7_options INTERFACE -static -Wl,--no-insert-timestamp)
elseif(NOT KZ7_SANITIZERS)
  # A shared libstdc++ adds half a millisecond to every start; a fully static program could not load a level library.
  target_link_options(kz7_options INTERFACE -static-libstdc++ -static-libgcc)
  # What is linked and not used makes the start slower, and so does each relocation.
  target_link_options(kz7_options INTERFACE -Wl,--gc-sections -Wl,-z,pack-relative-relocs)
endif()

# CLI11 and nlohmann-json are header-only libraries of the host. Their include directory is the host's own, which a cross
# compiler must never search, so the build tree gets links to the directories of the libraries alone.
find_package(CLI11 REQUIRED CONFIG PATHS /usr/share/cmake NO_CMAKE_FIND_ROOT_PATH)
find_package(nlohmann_json REQUIRED CONFIG PATHS /usr/share/cmake NO_CMAKE_FIND_ROOT_PATH)
file(MAKE_DIRECTORY ${PROJECT_BINARY_DIR}/headers)
foreach(library IN ITEMS CLI11::CLI11 nlohmann_json::nlohmann_json)
  get_target_property(includes ${library} INTERFACE_INCLUDE_DIRECTORIES)
  list(GET includes 0 includes)
  foreach(folder IN ITEMS CLI nlohmann)
    if(EXISTS ${includes}/${folder})
      file(CREATE_LINK ${includes}/${folder} ${PROJECT_BINARY_DIR}/headers/${folder} SYMBOLIC)
    endif()
  endforeach()
endforeach()
add_library(kz7_headers INTERFACE)
target_include_directories(kz7_headers SYSTEM INTERFACE ${PROJECT_BINARY_DIR}/headers)

# Gives a Windows program or library its version resource.
function(kz7_version_resource target description)
  if(WIN32)
    set(suffix .exe)
    set(type 1) # an application
    get_target_property(kind ${target} TYPE)
    if(kind STREQUAL SHARED_LIBRARY)
      set(suffix .dll)
      set(type 2)
    endif()
    configure_file(${PROJECT_SOURCE_DIR}/cmake/version.rc.in ${target}.rc @ONLY)
    # Apart, because the resource compiler does not know the options of the target.
    add_library(${target}_version OBJECT ${CMAKE_CURRENT_BINARY_DIR}/${target}.rc)
    target_link_libraries(${target} PRIVATE ${target}_version)
  endif()
endfunction()

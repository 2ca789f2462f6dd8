# One place for the language level, the warnings and the sanitizers of every target.
set(CMAKE_CXX_STANDARD 20)
set(CMAKE_CXX_STANDARD_REQUIRED ON)
set(CMAKE_CXX_EXTENSIONS OFF)
set(CMAKE_POSITION_INDEPENDENT_CODE ON)
set(CMAKE_CXX_VISIBILITY_PRESET hidden)
set(CMAKE_VISIBILITY_INLINES_HIDDEN ON)

find_package(Threads REQUIRED)
find_package(PkgConfig REQUIRED)

# A trace or printf call whose arguments do not fit its format is undefined behaviour as root: never let it build.
add_compile_options(-Wall -Wextra -Wshadow -Wnon-virtual-dtor -Wformat=2 -Werror=format -Werror=return-type)
if(CMAKE_CXX_COMPILER_ID STREQUAL "GNU")
  add_compile_options(-Wno-restrict)  # where it optimises, g++ 12 sees overlaps in joined std::strings that are not there
endif()
if(VMQ_WERROR)
  add_compile_options(-Werror)
endif()
if(VMQ_SANITIZE)
  add_compile_options(-fsanitize=${VMQ_SANITIZE} -fno-sanitize-recover=all -fno-omit-frame-pointer)
  add_link_options(-fsanitize=${VMQ_SANITIZE})
else()
  add_compile_options(-fstack-protector-strong)
endif()
include_directories(${PROJECT_SOURCE_DIR})

find_program(CCACHE ccache)
if(CCACHE)
  set(CMAKE_CXX_COMPILER_LAUNCHER ${CCACHE})
endif()

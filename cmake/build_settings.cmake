# build_settings: the language level, warnings, hardening and run-time libraries of every program.
include(CheckPIESupported)
check_pie_supported(LANGUAGES CXX)
set(CMAKE_POSITION_INDEPENDENT_CODE ON)

add_library(build_settings INTERFACE)
target_compile_features(build_settings INTERFACE cxx_std_17)
# On 32 bits, too, files may be larger than 2 GiB.
target_compile_definitions(build_settings INTERFACE _FILE_OFFSET_BITS=64)
target_compile_options(build_settings INTERFACE
  -Wall -Wextra -Wpedantic -Wconversion -Wshadow $<$<BOOL:${RUV_WERROR}>:-Werror>)

if(RUV_SANITIZE)
  target_compile_options(build_settings INTERFACE
    -fsanitize=${RUV_SANITIZE} -fno-sanitize-recover=all -fno-omit-frame-pointer)
  target_link_options(build_settings INTERFACE -fsanitize=${RUV_SANITIZE})
else()
  target_compile_options(build_settings INTERFACE -fstack-protector-strong)
  # Fortification needs an optimising build.
  target_compile_options(build_settings INTERFACE $<$<NOT:$<CONFIG:Debug>>:-U_FORTIFY_SOURCE -D_FORTIFY_SOURCE=2>)
endif()
target_link_options(build_settings INTERFACE -Wl,-z,relro,-z,now)

# Leave unused library code out of the programs.
target_compile_options(build_settings INTERFACE -ffunction-sections -fdata-sections)
target_link_options(build_settings INTERFACE -Wl,--gc-sections)

# Start-up is faster without the two shared libraries, and the programs run where libstdc++ is older.
if(RUV_STATIC_RUNTIME)
  target_link_options(build_settings INTERFACE -static-libstdc++ -static-libgcc)
endif()

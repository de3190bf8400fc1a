# Vector kernels are written with NEON intrinsics. On AArch64 they compile natively;
# elsewhere SIMDe maps them onto the host's vector unit so the same paths are tested.
add_library(tactus_neon INTERFACE)
if(CMAKE_SYSTEM_PROCESSOR MATCHES "aarch64|arm64|ARM64")
  target_compile_definitions(tactus_neon INTERFACE LQ_HAVE_NEON=1)
else()
  find_path(SIMDE_INCLUDE_DIR simde/arm/neon.h)
  if(SIMDE_INCLUDE_DIR)
    target_include_directories(tactus_neon SYSTEM INTERFACE ${SIMDE_INCLUDE_DIR})
    target_compile_definitions(tactus_neon INTERFACE LQ_HAVE_NEON=1 LQ_NEON_SIMDE=1)
  else()
    message(WARNING "SIMDe not found: vector kernels are left out, scalar paths only")
  endif()
endif()

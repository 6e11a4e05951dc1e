# The LV2 plugin beside Dragonfly's reverbs through one lilv host (real-time factors at 64-frame blocks).
if(TARGET ulvetta_lv2)
  find_package(PkgConfig REQUIRED)
  pkg_check_modules(LILV REQUIRED IMPORTED_TARGET lilv-0)
  ulvetta_add_bench(lv2_bench SOURCES Lv2Bench.cpp LIBS ulvetta_core PkgConfig::LILV)
  target_include_directories(lv2_bench PRIVATE ${PROJECT_SOURCE_DIR}/tests ${PROJECT_SOURCE_DIR}/apps/lv2)
  target_compile_definitions(lv2_bench PRIVATE ULVETTA_LV2_BUNDLE="${ULVETTA_LV2_BUNDLE}")
  add_dependencies(lv2_bench ulvetta_lv2)
endif()

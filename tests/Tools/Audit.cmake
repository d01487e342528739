# formatdesc probe over a media library (AuditTest.cpp): the tool run on a generated folder tree,
# sharded with GNU parallel, its report read by xmllint and drawn by rsvg-convert, and --json of a
# large description. The tests share the work folder, so they run one at a time.
add_executable(AuditTest AuditTest.cpp)
tarvek_configure_target(AuditTest)
target_link_libraries(AuditTest PRIVATE Tarvek::Formats Tarvek::Inspect nlohmann_json::nlohmann_json
                                        GTest::gtest GTest::gtest_main)
target_compile_definitions(AuditTest PRIVATE FORMATDESC="$<TARGET_FILE:formatdesc>"
                                             PROBE_MEDIA="${media}"
                                             AUDIT_WORK="${CMAKE_CURRENT_BINARY_DIR}/audit")
gtest_discover_tests(AuditTest TEST_PREFIX Formatdesc.Audit. DISCOVERY_TIMEOUT 60
                     PROPERTIES FIXTURES_REQUIRED ProbeMedia RESOURCE_LOCK formatdesc-audit)

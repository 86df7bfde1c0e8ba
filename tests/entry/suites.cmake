qtb_add_test(catalog_test BRIEF SOURCES entry/catalog_test.cpp LIBRARIES qtb_static qtb_platform_static)
qtb_add_test(checks_test SOURCES entry/checks_test.cpp LIBRARIES qtb_static)
qtb_add_test(entries_test BRIEF SOURCES entry/entries_test.cpp LIBRARIES qtb_static)
qtb_add_test(header_test SOURCES entry/header_test.cpp entry/header_c.c entry/header_cpp98.cpp)
set_source_files_properties(entry/header_cpp98.cpp PROPERTIES COMPILE_OPTIONS "-std=c++98;-pedantic;-Werror")
qtb_add_test(lsame_test BRIEF SOURCES entry/lsame_test.cpp LIBRARIES qtb_static)
qtb_add_test(messages_test BRIEF SOURCES entry/messages_test.cpp platform/fake_messages.cpp LIBRARIES qtb_static)
qtb_add_test(version_test BRIEF SOURCES entry/version_test.cpp LIBRARIES qtb_static)
qtb_add_test(xerbla_test BRIEF SOURCES entry/xerbla_test.cpp platform/fake_messages.cpp LIBRARIES qtb_static)

# The corpora of the fuzz targets.
foreach(name catalog_text xerbla)
  qtb_add_test(${name}_corpus_test BRIEF SOURCES fuzz/replay_test.cpp fuzz/${name}_fuzz.cpp platform/fake_messages.cpp
    LIBRARIES qtb_static)
  target_compile_definitions(${name}_corpus_test PRIVATE
    QTB_TEST_CORPUS="${PROJECT_SOURCE_DIR}/tests/fuzz/corpus/${name}")
endforeach()
qtb_add_test(catalog_file_corpus_test BRIEF SOURCES fuzz/replay_test.cpp fuzz/catalog_file_fuzz.cpp
  LIBRARIES qtb_platform_static)
target_compile_definitions(catalog_file_corpus_test PRIVATE
  QTB_TEST_CORPUS="${PROJECT_SOURCE_DIR}/tests/fuzz/corpus/catalog_file")

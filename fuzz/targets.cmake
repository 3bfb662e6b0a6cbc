# The fuzz targets, one call each: ut_fuzz_target(name sources...) with sources relative to fuzz/.
# fuzz/CMakeLists.txt turns each into a libFuzzer binary; tests/CMakeLists.txt into a replay of
# fuzz/corpus/<name>/ under CTest.
ut_fuzz_target(stream stream_fuzz.cpp)
ut_fuzz_target(mifile mifile_fuzz.cpp)
ut_fuzz_target(compare compare_fuzz.cpp)
# The ".reg" import writes to the registry's roots: it runs on the private store in memory that
# only the POSIX home has. Our own compound-file reader and dropped-file list are POSIX's too; on
# Windows they are the system's, not ours to fuzz.
if(NOT WIN32)
  ut_fuzz_target(regfile regfile_fuzz.cpp)
  ut_fuzz_target(storage storage_fuzz.cpp)
  ut_fuzz_target(dataobject dataobject_fuzz.cpp)
endif()
# What `ut stream dump` shows of any bytes.
ut_fuzz_target(stream_dump stream_dump_fuzz.cpp ../tools/ut/stream_decoder.cpp)
# A scene file's summary information: the thumbnail read, replaced and read again.
ut_fuzz_target(thumbnail thumbnail_fuzz.cpp)

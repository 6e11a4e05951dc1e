# The editor's full repaint of the 750 x 167 back buffer, the reverb page's repaint and its meter tick.
ulvetta_add_bench(editor_bench SOURCES ${CMAKE_CURRENT_SOURCE_DIR}/EditorBench.cpp LIBS ulvetta_editor_png)
target_include_directories(editor_bench PRIVATE ${PROJECT_SOURCE_DIR}/tests)

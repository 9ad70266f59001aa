find_program(PYTHON3 python3 REQUIRED)
mark_as_advanced(PYTHON3)
add_test(NAME packaging/recipes COMMAND ${PYTHON3} ${CMAKE_CURRENT_LIST_DIR}/check_recipes.py ${PROJECT_SOURCE_DIR})

# Looks for what the Python module needs: the system's Python with its headers, and pybind11.
# XQUERY_HAS_PYTHON says whether all is there, XQUERY_LACKS_FOR_PYTHON what is not.
#
# Other Pythons may come first in PATH, those of version managers for example; pybind11 and the
# packages of the tests are the system's, and so is the Python that they belong to. XQUERY_PYTHON
# chooses another one.

set(system_python "/usr/bin/python3")
if(NOT EXISTS "${system_python}")
  set(system_python "")
endif()
set(XQUERY_PYTHON "${system_python}" CACHE FILEPATH "The Python that the module is for")
if(XQUERY_PYTHON)
  set(Python_EXECUTABLE "${XQUERY_PYTHON}")
endif()

set(XQUERY_HAS_PYTHON OFF)
set(XQUERY_LACKS_FOR_PYTHON "")
set(Python_FIND_VIRTUALENV STANDARD)
find_package(Python 3.11 QUIET COMPONENTS Interpreter Development.Module)
if(NOT Python_Interpreter_FOUND)
  set(XQUERY_LACKS_FOR_PYTHON "Python 3.11 (Debian's python3)")
elseif(NOT Python_Development.Module_FOUND)
  set(XQUERY_LACKS_FOR_PYTHON "the headers of ${Python_EXECUTABLE} (Debian's python3-dev)")
else()
  set(PYBIND11_FINDPYTHON ON)
  find_package(pybind11 2.10 QUIET CONFIG)
  if(pybind11_FOUND)
    set(XQUERY_HAS_PYTHON ON)
  else()
    set(XQUERY_LACKS_FOR_PYTHON "pybind11 (Debian's pybind11-dev)")
  endif()
endif()

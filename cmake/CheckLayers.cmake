# Refuses, at configure time, an include that runs against the layering of
# docs/architecture.md. Each core folder may include only the folders listed
# for it; platform/ (the adapters) may include any core folder, and no core
# folder may include platform/. Tests (*_test.cpp) and test doubles
# (testing/ folders) may also include adapters and other doubles, since they
# stand in for the composition root.

set(TAV_LAYER_support  support)
set(TAV_LAYER_ports    support ports)
set(TAV_LAYER_config   support ports config)
set(TAV_LAYER_schedule support ports schedule)
set(TAV_LAYER_suite    support ports config suite)
set(TAV_LAYER_sequence support ports config suite sequence)
set(TAV_LAYER_show     support ports config schedule suite sequence show)
set(TAV_LAYER_host     support ports config schedule suite sequence show host)
set(TAV_LAYER_platform support ports config schedule suite sequence show host platform)

function(tav_check_layers source_dir)
  set(violations "")
  foreach(layer support ports config schedule suite sequence show host platform)
    file(GLOB_RECURSE files ${source_dir}/src/${layer}/*.h ${source_dir}/src/${layer}/*.cpp)
    foreach(file ${files})
      file(RELATIVE_PATH rel ${source_dir} ${file})
      set(allowed ${TAV_LAYER_${layer}})
      if(rel MATCHES "_test\\.cpp$" OR rel MATCHES "/testing/")
        list(APPEND allowed platform)
      endif()
      file(STRINGS ${file} includes REGEX "^#include \"[a-z]+/")
      foreach(line ${includes})
        string(REGEX REPLACE "^#include \"([a-z]+)/.*" "\\1" target "${line}")
        list(FIND allowed ${target} found)
        if(found EQUAL -1)
          string(APPEND violations "\n  ${rel}: ${line}")
        endif()
      endforeach()
    endforeach()
  endforeach()
  if(violations)
    message(FATAL_ERROR "Includes against the layering of docs/architecture.md:${violations}")
  endif()
endfunction()

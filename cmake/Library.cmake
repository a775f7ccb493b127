set(GRIDMILL_SOURCES
    basic/exceptions/exceptions.cpp
    basic/tessel/complexinterpretation.cpp
    basic/tessel/datatype.cpp
    basic/tessel/mask/mask.cpp
    basic/tessel/raster.cpp
    processes/gridmill/averagechannels.cpp
    processes/gridmill/bitmapfiltering.cpp
    processes/gridmill/chandiffchange.cpp
    processes/gridmill/chandiffchange2.cpp
    processes/gridmill/chanratiochange.cpp
    processes/gridmill/chanratiochange2.cpp
    processes/gridmill/combchange.cpp
    processes/gridmill/filterasp.cpp
    processes/gridmill/filterslp.cpp
    processes/gridmill/iiidatatransfer.cpp
    processes/gridmill/intenpercent.cpp
    processes/gridmill/intenratiochange.cpp
    processes/gridmill/magnitudechange.cpp
    processes/gridmill/mirrorimg.cpp
    processes/gridmill/normalize.cpp
    processes/gridmill/percentile.cpp
    processes/gridmill/rangeclasses.cpp
    processes/gridmill/rasterstatistics.cpp
    processes/gridmill/singlechange.cpp
    processes/gridmill/spotblue.cpp
    processes/gridmill/sqrgradient.cpp
    processes/gridmill/tasseledcapchange.cpp
    processes/gridmill/vegindex.cpp
    processes/gridmill/vollath.cpp
    processes/gridmill/frame/changerows.cpp
    processes/gridmill/frame/filterrows.cpp
    processes/gridmill/frame/pixelreader.cpp
    processes/gridmill/frame/pixelwriter.cpp
    processes/gridmill/frame/scanlock.cpp
    processes/gridmill/kernels/bytecolours.cpp
    processes/gridmill/kernels/changenodata.cpp
    processes/gridmill/kernels/channelratio.cpp
    processes/gridmill/kernels/difference.cpp
    processes/gridmill/kernels/focussums.cpp
    processes/gridmill/kernels/integermean.cpp
    processes/gridmill/kernels/logarithm.cpp
    processes/gridmill/kernels/maskedcells.cpp
    processes/gridmill/kernels/orderedsums.cpp
    processes/gridmill/kernels/percentilespline.cpp
    processes/gridmill/kernels/pixelgather.cpp
    processes/gridmill/kernels/pixelplanes.cpp
    processes/gridmill/kernels/reverse.cpp
    processes/gridmill/kernels/rowconversions.cpp
    processes/gridmill/kernels/samplecounts.cpp
    processes/gridmill/kernels/syntheticblue.cpp
    processes/gridmill/kernels/thresholds.cpp
    processes/gridmill/kernels/validrange.cpp
    processes/gridmill/kernels/vegetation.cpp
    processes/gridmill/kernels/wholedegrees.cpp)
list(TRANSFORM GRIDMILL_SOURCES PREPEND ${PROJECT_SOURCE_DIR}/)

# Installed headers: the public ones of the house and those that they include.
set(GRIDMILL_HEADERS
    basic/core/export.h
    basic/core/interpretationtypes.h
    basic/core/typedispatch/extendtypedispatch.h
    basic/core/typedispatch/typedispatch.h
    basic/core/typedispatch/typelist.h
    basic/exceptions/exceptions.h
    basic/exceptions/throw.h
    basic/tessel/complexinterpretation.h
    basic/tessel/datatype.h
    basic/tessel/mask/mask.h
    basic/tessel/mask/maskdecision.h
    basic/tessel/raster.h
    processes/gridmill/averagechannels.h
    processes/gridmill/bitmapfiltering.h
    processes/gridmill/chandiffchange.h
    processes/gridmill/chandiffchange2.h
    processes/gridmill/changeparams.h
    processes/gridmill/chanratiochange.h
    processes/gridmill/chanratiochange2.h
    processes/gridmill/combchange.h
    processes/gridmill/difftype.h
    processes/gridmill/filterasp.h
    processes/gridmill/filterslp.h
    processes/gridmill/frame/processorcache.h
    processes/gridmill/gridmill.h
    processes/gridmill/ichange.h
    processes/gridmill/iiidatatransfer.h
    processes/gridmill/intenpercent.h
    processes/gridmill/intenratiochange.h
    processes/gridmill/iprocessor.h
    processes/gridmill/magnitudechange.h
    processes/gridmill/mirrorimg.h
    processes/gridmill/normalize.h
    processes/gridmill/percentile.h
    processes/gridmill/rangeclasses.h
    processes/gridmill/rasterstatistics.h
    processes/gridmill/singlechange.h
    processes/gridmill/spotblue.h
    processes/gridmill/sqrgradient.h
    processes/gridmill/tasseledcapchange.h
    processes/gridmill/vegindex.h
    processes/gridmill/vollath.h)

# gridmill_objects(<name> <isa>): the compiled sources for one setting of GRIDMILL_ISA.
function(gridmill_objects name isa)
  add_library(${name} OBJECT ${GRIDMILL_SOURCES})
  set_target_properties(${name} PROPERTIES POSITION_INDEPENDENT_CODE ON CXX_VISIBILITY_PRESET hidden
                                           VISIBILITY_INLINES_HIDDEN ON)
  target_include_directories(${name} PUBLIC ${PROJECT_SOURCE_DIR})
  target_link_libraries(${name} PRIVATE gridmill_numerics gridmill_warnings OpenMP::OpenMP_CXX)
  if(isa MATCHES "^x86-64(-v[34])?$")
    # By flags, not attributes: g++ drops the attribute of a template that was declared without it.
    target_compile_definitions(${name} PRIVATE GRIDMILL_PINNED)
    target_compile_options(${name} PRIVATE -march=${isa})
  elseif(NOT isa STREQUAL "auto")
    message(FATAL_ERROR "GRIDMILL_ISA is '${isa}'; expected auto, x86-64, x86-64-v3 or x86-64-v4")
  endif()
  # The library alone: what a test instantiates for itself would hide what the library's own copy lacks.
  target_compile_options(${name} PRIVATE ${GRIDMILL_COVERAGE_FLAGS})
endfunction()

gridmill_objects(gridmill_objects ${GRIDMILL_ISA})

add_library(gridmill SHARED $<TARGET_OBJECTS:gridmill_objects>)
add_library(gridmill::gridmill ALIAS gridmill)
set_target_properties(gridmill PROPERTIES VERSION ${PROJECT_VERSION} SOVERSION ${GRIDMILL_ABI})
target_include_directories(
  gridmill INTERFACE $<BUILD_INTERFACE:${PROJECT_SOURCE_DIR}>
                     $<INSTALL_INTERFACE:${CMAKE_INSTALL_INCLUDEDIR}/gridmill>)
target_compile_features(gridmill INTERFACE cxx_std_17)
target_link_libraries(gridmill PRIVATE OpenMP::OpenMP_CXX)
# Multiversioned functions and inner processors leave the compiler visible; the linker hides them.
target_link_options(gridmill PRIVATE LINKER:--version-script=${PROJECT_SOURCE_DIR}/cmake/gridmill.map)
set_property(TARGET gridmill APPEND PROPERTY LINK_DEPENDS ${PROJECT_SOURCE_DIR}/cmake/gridmill.map)

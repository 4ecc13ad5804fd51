# KXIPC::KXIPC is the shared library, KXIPC::KXIPC_static the other.
include(CMakeFindDependencyMacro)
find_dependency(Threads)
find_package(EXPAT QUIET) # the static one alone needs it
include(${CMAKE_CURRENT_LIST_DIR}/KXIPCTargets.cmake)

# The 32-bit target, built here with the cross compiler and run under user-mode emulation. script/sysroot brings the libraries
# that do not come with the compiler.
set(CMAKE_SYSTEM_NAME Linux)
set(CMAKE_SYSTEM_PROCESSOR arm)
set(CMAKE_CXX_COMPILER arm-linux-gnueabihf-g++)
get_filename_component(sysroot ${CMAKE_CURRENT_LIST_DIR}/../build/sysroot-armhf ABSOLUTE)
set(CMAKE_CROSSCOMPILING_EMULATOR
    qemu-arm -L /usr/arm-linux-gnueabihf
    -E LD_LIBRARY_PATH=${sysroot}/usr/lib/arm-linux-gnueabihf:${sysroot}/lib/arm-linux-gnueabihf)
# Where the linker looks for the libraries of our libraries.
add_link_options(
    -Wl,-rpath-link=${sysroot}/usr/lib/arm-linux-gnueabihf:${sysroot}/lib/arm-linux-gnueabihf)
set(CMAKE_FIND_ROOT_PATH ${sysroot} /usr/arm-linux-gnueabihf)
set(CMAKE_FIND_ROOT_PATH_MODE_PROGRAM NEVER)

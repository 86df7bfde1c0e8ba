# The made-up operating system, in the place of qtb_platform_static. Behind qtb_static on the linker's line.
add_library(qtb_platform_fake STATIC platform/fake.cpp platform/fake_messages.cpp)
target_include_directories(qtb_platform_fake PRIVATE ${PROJECT_SOURCE_DIR})
target_compile_options(qtb_platform_fake PRIVATE -O2 -Wall -Wextra)

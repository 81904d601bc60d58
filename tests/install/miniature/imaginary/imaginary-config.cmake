# A package that nobody else has.
add_library(Imaginary::unit INTERFACE IMPORTED)
set_target_properties(Imaginary::unit PROPERTIES INTERFACE_COMPILE_DEFINITIONS IMAGINARY_UNIT=7)

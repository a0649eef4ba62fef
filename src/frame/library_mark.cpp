// The data export that tells an engine this file is one of its libraries.
#include "frame.hpp"

CLI_EXPORT const std::int32_t sqlzThisIsAORVLibrary = 0;

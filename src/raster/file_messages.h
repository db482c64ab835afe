// Report texts shared by the raster file classes.
#pragma once

namespace raster_messages {

constexpr const char* kNotOpened = "File not opened!";
constexpr const char* kReadFailed = "File reading failed!";
constexpr const char* kWriteFailed = "File writing failed!";

}  // namespace raster_messages

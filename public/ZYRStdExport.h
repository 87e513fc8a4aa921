// Export marker for the library's interface; everything else stays hidden.
#pragma once

#define ZYRSTD_API __attribute__((visibility("default")))

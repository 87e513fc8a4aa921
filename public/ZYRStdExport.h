/// \file
/// Export marker for the library's interface; everything else stays hidden.
#pragma once

/// Marks a declaration as part of the exported interface of the shared library.
#define ZYRSTD_API __attribute__((visibility("default")))

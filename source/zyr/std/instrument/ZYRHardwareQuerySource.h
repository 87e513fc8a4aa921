/// \file
/// Answers "SELECT * FROM <class>" for the hardware classes from the files Linux keeps
/// under /proc, /sys and /etc: one row per object, each property as text.
#pragma once

#include <functional>
#include <map>
#include <string>
#include <string_view>
#include <vector>

#include "ZYRStdExport.h"

namespace ZYRStd {

/// Where the hardware information is read from: the system's files below a root, so that
/// tests can supply their own tree.
class ZYRSTD_API ZYRHardwareQuerySource {
public:
    /// One record of a query: field name to text.
    using Row = std::map<std::string, std::string>;

    /// Reads below `root` ("/" for this machine).
    explicit ZYRHardwareQuerySource(std::string root = "/");

    /// Rows of "SELECT * FROM Win32_Processor", "Win32_OperatingSystem",
    /// "Win32_PhysicalMemory", "Win32_DiskDrive", "Win32_PerfFormattedData_PerfOS_Memory" or
    /// "Win32_PerfFormattedData_PerfOS_Processor"; false for any other query or when the
    /// files that answer it cannot be read.
    [[nodiscard]] bool run(std::string_view query, std::vector<Row>& rows) const;

    /// What runs between the two /proc/stat samples of the processor load (a 100 ms sleep).
    void setBetweenSamples(std::function<void()> wait);

private:
    std::string path(std::string_view relative) const;
    bool processors(std::vector<Row>& rows) const;
    bool operatingSystem(std::vector<Row>& rows) const;
    bool physicalMemory(std::vector<Row>& rows) const;
    bool diskDrives(std::vector<Row>& rows) const;
    bool memoryPerformance(std::vector<Row>& rows) const;
    bool processorPerformance(std::vector<Row>& rows) const;

    std::string root_;
    std::function<void()> betweenSamples_;
};

} // namespace ZYRStd

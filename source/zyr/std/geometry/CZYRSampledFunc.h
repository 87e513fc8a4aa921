/// \file
/// One-dimensional functions given by sample points, and their 8-bit resampling.
#pragma once

#include <algorithm>
#include <cstring>

#include "ZYRStdExport.h"
#include "zyr/std/core/CZYRClientBase.h"
#include "zyr/std/memory/CZYRMemBuffer.h"

namespace ZYRStd {

/// A closed interval [min, max].
template <class T> struct sZYRRangeT {
    T min; ///< lower end
    T max; ///< upper end
};

/// A sample point (x, y).
template <class T> struct sZYRPointT {
    T x; ///< argument
    T y; ///< value
};

/// Piecewise linear over points with ascending x.
template <class T> class CZYRSampledFunc : public CZYRClientBase {
public:
    /// A sample point.
    using Point = sZYRPointT<T>;

    CZYRSampledFunc() = default;
    /// A function without points over `domain` with values in `range`.
    CZYRSampledFunc(sZYRRangeT<T> domain, sZYRRangeT<T> range) : domain_(domain), range_(range) {}
    /// Copies domain, range and points; throws kZYRErrorOutOfMemory.
    CZYRSampledFunc(const CZYRSampledFunc& other)
        : CZYRClientBase(), domain_(other.domain_), range_(other.range_) {
        setPoints(other.getPoints(), other.getPointCount());
    }
    /// Copies domain, range and points; throws kZYRErrorOutOfMemory.
    CZYRSampledFunc& operator=(const CZYRSampledFunc& other) {
        if (this != &other) {
            domain_ = other.domain_;
            range_ = other.range_;
            setPoints(other.getPoints(), other.getPointCount());
        }
        return *this;
    }
    ~CZYRSampledFunc() override = default;

    /// The interval of arguments.
    sZYRRangeT<T> getDomain() const { return domain_; }
    /// The interval of values.
    sZYRRangeT<T> getRange() const { return range_; }
    /// Replaces the interval of arguments.
    void setDomain(sZYRRangeT<T> domain) { domain_ = domain; }
    /// Replaces the interval of values.
    void setRange(sZYRRangeT<T> range) { range_ = range; }
    /// The number of sample points.
    unsigned int getPointCount() const { return count_; }
    /// The sample points, borrowed until the next setPoints.
    const Point* getPoints() const { return points_.data(); }
    /// Checked: an index past the points throws kZYRErrorBadParam "invalid index".
    const Point& getPoint(unsigned int index) const {
        if (index >= count_)
            throwInvalidMemBufferIndex(__LINE__);
        return points_[index];
    }

    /// Copies the points; throws kZYRErrorOutOfMemory when the buffer cannot grow.
    void setPoints(const Point* points, unsigned int count) {
        if (count > points_.count())
            points_.grow(count);
        if (count)
            std::memcpy(points_.data(), points, sizeof(Point) * count);
        count_ = count;
    }

private:
    using Buffer = CZYRMemBuffer<Point>;

    sZYRRangeT<T> domain_{0, 1};
    sZYRRangeT<T> range_{0, 1};
    Buffer points_;
    unsigned int count_ = 0;
};

/// Receives each resampled output; the result is not used.
class ZYRSTD_API IEncodedDataCBProc {
public:
    /// Called with the sample number `index` and its encoded value.
    virtual bool encodedSample(int index, float value) = 0;

protected:
    ~IEncodedDataCBProc() = default;
};

/// Calls `cb` n times with the function sampled evenly over its domain, scaled so that the
/// function's range maps onto 0 to 255; returns (0, 255). Fewer than two points throw
/// kZYRErrorBadParam "invalid index" before any call.
ZYRSTD_API sZYRRangeT<float> Caculate8BitEncodedSamples(const CZYRSampledFunc<float>& f, int n,
                                                        IEncodedDataCBProc& cb);

} // namespace ZYRStd

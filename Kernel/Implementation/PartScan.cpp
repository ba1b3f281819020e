#include "PartScan.h"

namespace PartScan {

Result Scan(const Input &input)
{
    Result result;
    result.partStyle = input.partStyle;
    return result;
}

Result ScanDevice(CDevice &, const DeviceInfo &descriptor, cRoot *)
{
    Result result;
    result.partStyle = descriptor.partStyle;
    return result;
}

} // namespace PartScan

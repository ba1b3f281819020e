#include "ClientFramework/NodeTree/VolumeIntegrityGroup.h"

#include "Kernel/Implementation/FS/Volume.h"
#include "Kernel/Implementation/FS/VolumeIntegrity.h"

#include <QCoreApplication>

namespace VolumeIntegrityGroup {

PropertyGroup of(CVolume *volume)
{
    PropertyGroup group{QCoreApplication::translate("NodeCore", "Volume Integrity Info"), {}};
    if (!volume || !volume->IsReady())
        return group;
    std::uint64_t valid = 0;
    std::uint64_t checked = 0;
    const std::uint32_t grade = volume->GetIntegrity(valid, checked);
    group.items.append({QCoreApplication::translate("NodeCore", "Overall Integrity Status"),
                        VolumeIntegrity::GradeName(grade), QString()});
    for (const VolumeIntegrity::Item &item : VolumeIntegrity::Items(volume->GetKind(), valid, checked))
        group.items.append({item.name, item.state, QString()});
    return group;
}

} // namespace VolumeIntegrityGroup

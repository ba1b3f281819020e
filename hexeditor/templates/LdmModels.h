// The templates of the Logical Disk Manager database records.
#pragma once

#include "hexeditor/templates/Model.h"
#include "hexeditor/templates/core/LdmBuilders.h"

namespace HexEditor::Templates {

template <class B> class LdmModel : public Model
{
public:
    explicit LdmModel(Storage *storage, QObject *parent = nullptr)
        : Model(storage, std::make_unique<B>(), parent)
    {
    }
};

using LdmPrivHeadModel = LdmModel<LdmPrivHeadBuilder>;
using LdmTocModel = LdmModel<LdmTocBuilder>;
using LdmVmdbModel = LdmModel<LdmVmdbBuilder>;
using LdmKlogModel = LdmModel<LdmKlogBuilder>;
using LdmVblkModel = LdmModel<LdmVblkBuilder>;

} // namespace HexEditor::Templates

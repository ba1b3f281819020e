// The GUID partition table template: the header sector and the 128-entry array.
#pragma once

#include "hexeditor/templates/Model.h"
#include "hexeditor/templates/core/GptBuilder.h"

namespace HexEditor::Templates {

class GptModel : public Model
{
    Q_OBJECT
public:
    explicit GptModel(Storage *storage, QObject *parent = nullptr)
        : Model(storage, std::make_unique<GptBuilder>(), parent)
    {
    }
};

} // namespace HexEditor::Templates

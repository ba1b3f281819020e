// The Master Boot Record template.
#pragma once

#include "hexeditor/templates/Model.h"
#include "hexeditor/templates/core/MbrBuilder.h"

namespace HexEditor::Templates {

class MbrModel : public Model
{
    Q_OBJECT
public:
    explicit MbrModel(Storage *storage, QObject *parent = nullptr)
        : Model(storage, std::make_unique<MbrBuilder>(), parent)
    {
    }
};

} // namespace HexEditor::Templates

#include "BaseLayer.h"

#include "LQ_Utils.h"

LQ::SharedPtr<BaseLayer> BaseLayer::getBottomLayer(int i) const {
    LQ_ASSERT_LT(i, (int)bottomLayers_.size());
    return bottomLayers_[i];
}

std::vector<std::string> BaseLayer::getBottomLayersName() const {
    std::vector<std::string> names;
    names.reserve(bottomLayers_.size());
    // a bottom that named no earlier layer in a file is an empty reference
    for (const LQ::SharedPtr<BaseLayer>& layer : bottomLayers_) names.push_back(layer ? layer->name() : std::string());
    return names;
}

void BaseLayer::baseSaveToCpp(std::ostream& stream, const std::string& name) const {
    stream << type() << "& " << name << "()\n"
           << "{\n"
           << "    static " << type() << " value(\"" << name << "\");\n"
           << "    return value;\n"
           << "}\n\n";
}

void BaseLayer::saveBaseLayer(LQ::ArchiveO& archive) const { archive & type() & name_; }

LQ::SharedPtr<BaseLayer> BaseLayer::loadBaseLayer(LQ::ArchiveI& archive) {
    std::string type, name;
    archive & type & name;
    return getBaseLayer(type, name);
}

std::string fixName(const std::string& name) {
    std::string fixed = name;
    for (char& c : fixed)
        if (c == '-' || c == '>') c = '_';
    return fixed;
}

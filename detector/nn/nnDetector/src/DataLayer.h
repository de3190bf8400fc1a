#pragma once
// The network's input: its blob is set from outside before each run.

#include "BaseLayer.h"

class DataLayer : public BaseLayer {
public:
    explicit DataLayer(const std::string& name) : BaseLayer(name) {}

    void forward() override;
    std::string type() const override { return "DataLayer"; }
    void serialize(LQ::ArchiveO& archive) const override {}
    void serialize(LQ::ArchiveI& archive) override {}
    void saveToCpp(std::ostream& stream, const std::string& name) override { baseSaveToCpp(stream, name); }
    LQ::SharedPtr<BaseLayer> clone() override;
    bool compare(const BaseLayer& layer) const override;
};

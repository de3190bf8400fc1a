#pragma once
// A layer of the network runtime: it owns one output blob and reads the output blobs of
// its bottom layers, which it shares with the network.

#include <ostream>
#include <string>
#include <vector>

#include "Blob.h"
#include "LQ_ArchiveI.h"
#include "LQ_ArchiveO.h"
#include "LQ_SharedPtr.h"

class BaseLayer {
public:
    explicit BaseLayer(const std::string& name) : name_(name) {}
    virtual ~BaseLayer() = default;

    // computes top_ from the bottom layers' blobs
    virtual void forward() = 0;
    virtual void prune() {}
    virtual std::string type() const = 0;
    // the layer's own parameters; type, name and bottoms are the network's business
    virtual void serialize(LQ::ArchiveO& archive) const = 0;
    virtual void serialize(LQ::ArchiveI& archive) = 0;
    // the generated source of this layer: its blobs, then a function returning a static
    virtual void saveToCpp(std::ostream& stream, const std::string& name) = 0;
    // a fresh layer of the same type and name sharing the parameters, without bottoms
    // and with an empty output
    virtual LQ::SharedPtr<BaseLayer> clone() { return getBaseLayer(type(), name()); }
    // the layer's own parameters against another layer of the same class
    virtual bool compare(const BaseLayer& layer) const = 0;

    const std::string& name() const { return name_; }
    const Blob& getBlob() const { return top_; }
    void setBlob(const Blob& blob) { top_ = blob; }
    void addBottomLayer(const LQ::SharedPtr<BaseLayer>& layer) { bottomLayers_.push_back(layer); }
    const std::vector<LQ::SharedPtr<BaseLayer>>& bottomLayers() const { return bottomLayers_; }
    int getNumBottomLayers() const { return static_cast<int>(bottomLayers_.size()); }
    LQ::SharedPtr<BaseLayer> getBottomLayer(int i) const;
    std::vector<std::string> getBottomLayersName() const;

    bool operator==(const BaseLayer& layer) const { return compare(layer); }
    bool operator!=(const BaseLayer& layer) const { return !compare(layer); }

    // the source of a layer without parameters
    void baseSaveToCpp(std::ostream& stream, const std::string& name) const;
    void saveBaseLayer(LQ::ArchiveO& archive) const;
    // the layer of a type name, with its default parameters
    static LQ::SharedPtr<BaseLayer> getBaseLayer(const std::string& type, const std::string& name);
    // type and name from an archive, then the factory
    static LQ::SharedPtr<BaseLayer> loadBaseLayer(LQ::ArchiveI& archive);

protected:
    std::vector<LQ::SharedPtr<BaseLayer>> bottomLayers_;
    Blob top_;
    std::string name_;
};

// a name usable in source: "-" and ">" become "_"
std::string fixName(const std::string& name);

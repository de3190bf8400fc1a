#pragma once
// The trained cascades of one hand shape (the base set) and every orientation and mirror
// image derived from them. Quarter turns and mirrors are exact transforms of a cascade,
// so the ring knows which (angle, side) pairs it can offer and makes each variant, when
// first asked for, from the nearest cascade it already holds.

#include <map>
#include <string>
#include <vector>

#include "CascadedClassifier.h"
#include "ClassifierProperties.h"
#include "LQ_ObjectLocation.h"
#include "LQ_SharedPtr.h"

typedef std::map<std::string, std::string> mapStringString;

class ClassifierRing {
public:
    ClassifierRing() = default;
    explicit ClassifierRing(const std::string& path);
    // the cascades stay their owner's; the ring only points at them
    explicit ClassifierRing(const std::vector<CascadedClassifier*>& cascades);

    // a ".ring" text file; false if a cascade record can't be read
    bool load(const std::string& path);
    bool save(const std::string& path) const;
    // the generated source form; false if the file can't be opened
    bool saveHeader(const std::string& fileName) const;

    void generatePossibilities();
    // every cascade that serves the request, making the missing ones; the pointers stay
    // valid for the ring's life
    std::vector<CascadedClassifier*> getClassifiers(const LQ::AngleRange& angleRange, const LQ::Side::Value& side);

    bool isSymmetric() const;
    unsigned int getNumClassifiers() const { return static_cast<unsigned int>(baseClassifiers_.size()); }
    // 0x7fffffff leaves the thresholds as they are
    void setLastCascadeThreshold(int threshold);

    // the cascades and possibilities take the name too: hits carry their ring's name
    void setName(const std::string& name);
    void setConfig(const mapStringString& config) { config_ = config; }
    void setLog(const std::string& log) { log_ = log; }
    void setAngleRange(const LQ::AngleRange& angleRange) { angleRange_ = angleRange; }
    const std::string& getName() const { return name_; }
    const mapStringString& getConfig() const { return config_; }
    const std::string& getLog() const { return log_; }
    const std::vector<ClassifierProperties>& getPossibilities() const { return possibilities_; }
    const std::vector<LQ::SharedPtr<CascadedClassifier>>& getAllClassifiers() const { return classifiers_; }
    const std::vector<LQ::SharedPtr<CascadedClassifier>>& getBaseClassifiers() const { return baseClassifiers_; }

    // same name, config and base cascades
    bool operator==(const ClassifierRing& other) const;

private:
    std::string name_;
    std::string log_;
    mapStringString config_;
    LQ::AngleRange angleRange_;
    // base set first, then the variants in the order of their making
    std::vector<LQ::SharedPtr<CascadedClassifier>> classifiers_;
    std::vector<LQ::SharedPtr<CascadedClassifier>> baseClassifiers_;
    std::vector<ClassifierProperties> possibilities_;
};

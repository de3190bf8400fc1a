#include "ClassifierRing.h"

#include <fstream>
#include <iterator>
#include <limits>
#include <sstream>

#include "LQ_FileUtils.h"
#include "LQ_Time.h"
#include "LQ_Utils.h"

namespace {
// more base cascades than this means a corrupt file
constexpr int MAX_BASE_CASCADES = 10000;

// a config value as a C string literal's body
std::string escaped(const std::string& text) {
    std::string out;
    for (char c : text) {
        if (c == '"' || c == '\\') out += '\\';
        out += c;
    }
    return out;
}
}  // namespace

ClassifierRing::ClassifierRing(const std::string& path) { load(path); }

ClassifierRing::ClassifierRing(const std::vector<CascadedClassifier*>& cascades) {
    for (CascadedClassifier* cascade : cascades) {
        LQ::SharedPtr<CascadedClassifier> holder(cascade, false);
        classifiers_.push_back(holder);
        baseClassifiers_.push_back(holder);
    }
    generatePossibilities();
}

void ClassifierRing::setName(const std::string& name) {
    name_ = name;
    for (const LQ::SharedPtr<CascadedClassifier>& cascade : classifiers_) cascade->setName(name);
    for (ClassifierProperties& p : possibilities_) p.setName(name);
}

void ClassifierRing::generatePossibilities() {
    possibilities_.clear();
    for (const LQ::SharedPtr<CascadedClassifier>& cascade : baseClassifiers_) {
        cascade->setName(name_);
        ClassifierProperties p = *cascade;
        for (int turn = 0; turn < 4; ++turn) {
            if (angleRange_.contains(p.getAngle())) possibilities_.push_back(p);
            // a symmetric cascade at a multiple of 45 degrees is its own mirror up to a turn
            if (!(p.isSymmetric() && p.getAngle() % 45 == 0)) {
                ClassifierProperties q = p;
                q.flip();
                if (angleRange_.contains(q.getAngle())) possibilities_.push_back(q);
            }
            p.rotate();
        }
    }
}

std::vector<CascadedClassifier*> ClassifierRing::getClassifiers(const LQ::AngleRange& angleRange,
                                                                const LQ::Side::Value& side) {
    std::vector<CascadedClassifier*> result;
    std::vector<const ClassifierProperties*> missing;
    for (const ClassifierProperties& p : possibilities_) {
        if ((p.getSide() & side) == 0 || !angleRange.contains(p.getAngle())) continue;
        bool found = false;
        for (const LQ::SharedPtr<CascadedClassifier>& cascade : classifiers_) {
            if (static_cast<const ClassifierProperties&>(*cascade) == p) {
                result.push_back(cascade.get());
                found = true;
                break;
            }
        }
        if (!found) missing.push_back(&p);
    }
    for (const ClassifierProperties* wanted : missing) {
        const CascadedClassifier* source = nullptr;
        ClassifierProperties::Transformation best;
        for (const LQ::SharedPtr<CascadedClassifier>& cascade : classifiers_) {
            const ClassifierProperties::Transformation t = cascade->transformCost(*wanted);
            if (t.possible && t.cost() < best.cost()) {
                best = t;
                source = cascade.get();
            }
        }
        LQ_ASSERT_MSG(source, "no cascade of ring " << name_ << " turns into " << *wanted);
        LQ::SharedPtr<CascadedClassifier> made(new CascadedClassifier(*source));
        if (best.flip) made->flipVertically();
        for (int turn = 0; turn < 4 && made->getAngle() != wanted->getAngle(); ++turn) made->rotate();
        LQ_ASSERT_MSG(made->getAngle() == wanted->getAngle(),
                      "cascade at " << made->getAngle() << " doesn't reach " << wanted->getAngle());
        classifiers_.push_back(made);
        result.push_back(made.get());
    }
    return result;
}

bool ClassifierRing::isSymmetric() const {
    for (const LQ::SharedPtr<CascadedClassifier>& cascade : classifiers_)
        if (cascade->isSymmetric()) return true;
    return false;
}

void ClassifierRing::setLastCascadeThreshold(int threshold) {
    if (threshold == 0x7fffffff) return;
    for (const LQ::SharedPtr<CascadedClassifier>& cascade : classifiers_) cascade->setLastStageThreshold(threshold);
}

bool ClassifierRing::load(const std::string& path) {
    std::ifstream file(path.c_str(), std::ios::binary);
    LQ_ASSERT_MSG(file, "cannot open file '" << path << "'");
    LQ_ASSERT_MSG(LQ::getFileExtention(path) == ".ring", "only ring files supported");

    int count = 0;
    file >> name_ >> count;
    classifiers_.clear();
    baseClassifiers_.clear();
    possibilities_.clear();
    if (!file || count < 0 || count > MAX_BASE_CASCADES) return false;
    for (int k = 0; k < count; ++k) {
        LQ::SharedPtr<CascadedClassifier> cascade(new CascadedClassifier());
        const bool loaded = cascade->load(file);
        classifiers_.push_back(cascade);
        baseClassifiers_.push_back(cascade);
        if (!loaded) return false;
    }
    generatePossibilities();

    config_.clear();
    log_.clear();
    file.ignore(std::numeric_limits<std::streamsize>::max(), '\n');
    std::string line;
    std::getline(file, line);
    if (line == "config") {
        while (std::getline(file, line) && line != "log") {
            const size_t equal = line.find('=');
            if (equal == std::string::npos)
                config_[line] = line;
            else
                config_[line.substr(0, equal)] = line.substr(equal + 1);
        }
    }
    if (line == "log") log_.assign(std::istreambuf_iterator<char>(file), std::istreambuf_iterator<char>());
    return true;
}

bool ClassifierRing::save(const std::string& path) const {
    std::ofstream file(path.c_str(), std::ios::binary);
    if (!file) return false;
    file << name_ << '\n' << baseClassifiers_.size() << '\n';
    for (const LQ::SharedPtr<CascadedClassifier>& cascade : baseClassifiers_) {
        cascade->save(file);
        file << '\n';
    }
    file << "config\n";
    for (const auto& entry : config_) file << entry.first << '=' << entry.second << '\n';
    file << log_;
    file.flush();
    return static_cast<bool>(file);
}

bool ClassifierRing::saveHeader(const std::string& fileName) const {
    LQ_LOGD("fileName " << fileName << " " << name_);
    std::ofstream file(fileName.c_str(), std::ios::binary);
    if (!file) return false;
    const size_t slash = fileName.find_last_of("/\\");
    std::string stem = slash == std::string::npos ? fileName : fileName.substr(slash + 1);
    const size_t dot = stem.rfind('.');
    if (dot != std::string::npos) stem.erase(dot);
    const std::string time = LQ::fullTime();

    file << "/**\n"
         << " * @file " << stem << ".h\n"
         << " * @brief This file contains previously trained set of classifiers.\n"
         << " *\n"
         << " * Written by ClassifierRing::saveHeader from the ring " << name_ << ": " << baseClassifiers_.size()
         << " cascades. Do not edit; write it again from the ring.\n"
         << " */\n";
    file << "#include \"ClassifierMap.h\"\n";
    file << "// Creation time: " << time << "\n";
    file << "#ifdef __cplusplus\n"
         << "extern \"C\"\n"
         << "{\n"
         << "#endif // __cplusplus\n";
    file << "// For exporting from a Windows DLL:\n"
         << "#ifdef WIN32\n"
         << "#   define DLL_DECLSPEC __declspec(dllexport)\n"
         << "#else\n"
         << "#   define DLL_DECLSPEC __attribute__ ((visibility (\"default\")))\n"
         << "#endif\n";
    file << "    DLL_DECLSPEC ClassifierRing* " << stem << "();\n";
    file << "#ifdef __cplusplus\n"
         << "}\n"
         << "#endif // __cplusplus\n";
    file << "// Creation time: " << time << "\n";
    file << "ClassifierRing* " << stem << "()\n"
         << "{\n"
         << "    static ClassifierRing* pRing = NULL;\n"
         << "    if (pRing)\n"
         << "    {\n"
         << "        return pRing;\n"
         << "    }\n";
    for (size_t i = 0; i < baseClassifiers_.size(); ++i)
        baseClassifiers_[i]->writeClassifier(file, stem + "_r" + LQ::toStr(i));
    file << "    std::vector<CascadedClassifier*> classifiersVec;\n";
    for (size_t i = 0; i < baseClassifiers_.size(); ++i)
        file << "    classifiersVec.push_back(&" << stem << "_r" << i << "_cascadedClassifier);\n";
    file << "    static ClassifierRing ring(classifiersVec);\n"
         << "    pRing = &ring;\n"
         << "    ring.setName(\"" << stem << "\");\n";
    file << "    mapStringString config; \n";
    for (const auto& entry : config_)
        file << "    config[\"" << escaped(entry.first) << "\"]=\"" << escaped(entry.second) << "\";\n";
    file << "    ring.setConfig(config);\n";
    file << "    return &ring;\n"
         << "}\n\n";
    file << "LQ::SharedPtr<BaseDetector> " << stem << "(\n"
         << "        const PatternDetector::Parameters& parameters,\n"
         << "        const LQ::AngleRange& angleRange)\n"
         << "{\n"
         << "    static ClassifierRing* pRing = " << stem << "();\n"
         << "    static std::map<std::string, LQ::SharedPtr<BaseDetector> > mapDetectors;\n"
         << "    std::string parametersString = LQ::toStr(angleRange)\n"
         << "            + \"_\" + LQ::toStr(parameters);\n"
         << "    if (!mapDetectors[parametersString])\n"
         << "    {\n"
         << "        mapDetectors[parametersString] = new PatternDetector(\n"
         << "                    pRing, angleRange, LQ::Side::BOTH, parameters);\n"
         << "    }\n"
         << "    return mapDetectors[parametersString];\n"
         << "}\n\n";
    file << "LQ::SharedPtr<BaseDetector> " << stem << "(\n"
         << "        const PatternDetector::Parameters& parameters)\n"
         << "{\n"
         << "    return " << stem << "(parameters, LQ::AngleRange(-30, 30));\n"
         << "}\n";
    file.flush();
    return static_cast<bool>(file);
}

bool ClassifierRing::operator==(const ClassifierRing& other) const {
    if (name_ != other.name_ || config_ != other.config_ || baseClassifiers_.size() != other.baseClassifiers_.size())
        return false;
    for (size_t k = 0; k < baseClassifiers_.size(); ++k)
        if (!(*baseClassifiers_[k] == *other.baseClassifiers_[k])) return false;
    return true;
}

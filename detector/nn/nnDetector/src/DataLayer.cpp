#include "DataLayer.h"

#include "LQ_Utils.h"

void DataLayer::forward() {
    // nothing to compute: only make sure an input was set
    LQ_ASSERT_GE(top_.num(), 1);
    LQ_ASSERT_GE(top_.channels(), 1);
    LQ_ASSERT_GE(top_.width(), 1);
    LQ_ASSERT_GE(top_.height(), 1);
}

LQ::SharedPtr<BaseLayer> DataLayer::clone() {
    return LQ::SharedPtr<BaseLayer>(new DataLayer(name_));
}

bool DataLayer::compare(const BaseLayer& layer) const {
    const DataLayer* other = dynamic_cast<const DataLayer*>(&layer);
    return other && other->name() == name_;
}

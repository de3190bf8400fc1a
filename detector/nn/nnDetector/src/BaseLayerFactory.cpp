#include "BaseLayer.h"
#include "ConcatLayer.h"
#include "ContrastiveLayer.h"
#include "ConvolutionLayer.h"
#include "DataLayer.h"
#include "DeConvolutionLayer.h"
#include "FlattenLayer.h"
#include "InnerProductLayer.h"
#include "LQ_Utils.h"
#include "LinearTransformLayer.h"
#include "LocallyConnectedLayer.h"
#include "PReluLayer.h"
#include "PoolingLayer.h"
#include "ReluLayer.h"
#include "ReshapeLayer.h"
#include "SigmoidLayer.h"
#include "SliceLayer.h"
#include "SoftmaxLayer.h"
#include "SubtractLayer.h"
#include "TangensLayer.h"

// A chain of comparisons in a fixed order rather than a registry: the set of layer types
// is closed, and a model file can't name anything else. The heat-map and box layers
// aren't built yet; a file that names them is refused like any unknown type.
LQ::SharedPtr<BaseLayer> BaseLayer::getBaseLayer(const std::string& type, const std::string& name) {
    if (type == "DataLayer") return LQ::SharedPtr<BaseLayer>(new DataLayer(name));
    if (type == "ConvolutionLayer") return LQ::SharedPtr<BaseLayer>(new ConvolutionLayer(name));
    if (type == "ConcatLayer") return LQ::SharedPtr<BaseLayer>(new ConcatLayer(name));
    if (type == "FlattenLayer") return LQ::SharedPtr<BaseLayer>(new FlattenLayer(name, false));
    if (type == "InnerProductLayer") return LQ::SharedPtr<BaseLayer>(new InnerProductLayer(name));
    if (type == "PoolingLayer") return LQ::SharedPtr<BaseLayer>(new PoolingLayer(name));
    if (type == "ReluLayer") return LQ::SharedPtr<BaseLayer>(new ReluLayer(name));
    if (type == "PReluLayer") return LQ::SharedPtr<BaseLayer>(new PReluLayer(name));
    if (type == "ReshapeLayer") return LQ::SharedPtr<BaseLayer>(new ReshapeLayer(name));
    if (type == "SigmoidLayer") return LQ::SharedPtr<BaseLayer>(new SigmoidLayer(name));
    if (type == "SliceLayer") return LQ::SharedPtr<BaseLayer>(new SliceLayer(name, 1));
    if (type == "SoftmaxLayer") return LQ::SharedPtr<BaseLayer>(new SoftmaxLayer(name, 0.5f));
    if (type == "ContrastiveLayer") return LQ::SharedPtr<BaseLayer>(new ContrastiveLayer(name));
    if (type == "LinearTransformLayer") return LQ::SharedPtr<BaseLayer>(new LinearTransformLayer(name));
    if (type == "SubtractLayer") return LQ::SharedPtr<BaseLayer>(new SubtractLayer(name, Blob()));
    if (type == "TangensLayer") return LQ::SharedPtr<BaseLayer>(new TangensLayer(name));
    if (type == "LocallyConnectedLayer") return LQ::SharedPtr<BaseLayer>(new LocallyConnectedLayer(name));
    if (type == "DeConvolutionLayer") return LQ::SharedPtr<BaseLayer>(new DeConvolutionLayer(name));
    LQ_ASSERT_MSG(0, "Unknown type: " << type);
    return LQ::SharedPtr<BaseLayer>();
}

#pragma once
// What a generated network unit includes: the network class under the name the
// generated text spells, and every layer class it may build.

#include "Blob.h"
#include "ConcatLayer.h"
#include "ContrastiveLayer.h"
#include "ConvolutionLayer.h"
#include "DataLayer.h"
#include "DeConvolutionLayer.h"
#include "FlattenLayer.h"
#include "InnerProductLayer.h"
#include "LQ_SharedPtr.h"
#include "LQ_Size.h"
#include "LinearTransformLayer.h"
#include "LocallyConnectedLayer.h"
#include "NnDetector.h"
#include "PReluLayer.h"
#include "PoolingLayer.h"
#include "ReluLayer.h"
#include "ReshapeLayer.h"
#include "SigmoidLayer.h"
#include "SliceLayer.h"
#include "SoftmaxLayer.h"
#include "SubtractLayer.h"
#include "TangensLayer.h"

typedef NnDetector NNDetector;

#include <gtest/gtest.h>

#include <cmath>
#include <cstdlib>
#include <limits>

#include "frame_json.h"

TEST(FrameJson, EscapesStringsIntoValidJson) {
    EXPECT_EQ(jsonString(""), "\"\"");
    EXPECT_EQ(jsonString("3/5 \"ok\" C:\\dir"), "\"3/5 \\\"ok\\\" C:\\\\dir\"");
    EXPECT_EQ(jsonString("a\nb\tc\rd\x01\x1f"), "\"a\\nb\\tc\\rd\\u0001\\u001f\"");
    EXPECT_EQ(jsonString(std::string_view("a\0b", 3)), "\"a\\u0000b\"");
    // UTF-8 passes through; stray, truncated, overlong and surrogate bytes do not
    EXPECT_EQ(jsonString("caf\xc3\xa9 \xe2\x9c\x8b \xf0\x9f\x91\x8d"), "\"caf\xc3\xa9 \xe2\x9c\x8b \xf0\x9f\x91\x8d\"");
    EXPECT_EQ(jsonString("a\xff" "b\xc3"), "\"a\\ufffdb\\ufffd\"");
    EXPECT_EQ(jsonString("\xc0\xaf"), "\"\\ufffd\\ufffd\"");
    EXPECT_EQ(jsonString("\xed\xa0\x80"), "\"\\ufffd\\ufffd\\ufffd\"");
}

TEST(FrameJson, NumbersAreShortAndReadBackExactly) {
    EXPECT_EQ(jsonNumber(0.1f), "0.1");
    EXPECT_EQ(jsonNumber(-2.5f), "-2.5");
    EXPECT_EQ(jsonNumber(640.f), "640");
    EXPECT_EQ(jsonNumber(std::nanf("")), "null");
    EXPECT_EQ(jsonNumber(std::numeric_limits<float>::infinity()), "null");
    const float values[] = {1.f / 3, 16777217.f, 123456.789f, 1e-7f, 3.4028235e38f, 1.17549435e-38f, -0.f,
                            std::nextafter(1.f, 2.f)};
    for (float value : values) {
        const std::string text = jsonNumber(value);
        EXPECT_EQ(std::strtof(text.c_str(), nullptr), value) << text;
        EXPECT_EQ(std::signbit(std::strtof(text.c_str(), nullptr)), std::signbit(value)) << text;
        EXPECT_EQ(text.find_first_of("ni"), std::string::npos) << text;
    }
}

TEST(FrameJson, WritesEveryFieldOfEachResult) {
    EXPECT_EQ(frameJson(2, {}), "{\"frame\":2,\"gestures\":[]}");

    GestureResult full;
    full.gesture = "fist";
    full.rect = {{10.5f, 20, 110.25f, 140}};
    full.angle = 0.1f;
    full.point = {{60, 80.75f}};
    full.point3d = {{1, 2, -3}};
    full.parameters = {{"text", "3/5"}, {"side", "1"}, {"key-ring", "side text zoom "}, {"zoom", "2"}};
    GestureResult bare;
    bare.gesture = "thumb \"up\"";
    bare.parameters = {{"text", ""}, {"side", ""}, {"key-ring", ""}};
    EXPECT_EQ(frameJson(7, {full, bare}),
              "{\"frame\":7,\"gestures\":["
              "{\"gesture\":\"fist\",\"rect\":[10.5,20,110.25,140],\"angle\":0.1,\"point\":[60,80.75],"
              "\"point3d\":[1,2,-3],\"text\":\"3/5\",\"side\":\"1\",\"key-ring\":\"side text zoom \","
              "\"parameters\":{\"zoom\":\"2\"}},"
              "{\"gesture\":\"thumb \\\"up\\\"\"}]}");
    EXPECT_EQ(frameErrorJson(3, "check failed: \"x\""), "{\"frame\":3,\"error\":\"check failed: \\\"x\\\"\"}");
}

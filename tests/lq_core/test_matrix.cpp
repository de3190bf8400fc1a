#include <gtest/gtest.h>

#include <cmath>
#include <cstdio>
#include <initializer_list>
#include <sstream>
#include <string>
#include <vector>

#include "LQ_Matrix.h"
#include "LogCapture.h"

using namespace LQ;

namespace {

Matrix make(int width, int height, std::initializer_list<float> values) {
    EXPECT_EQ(static_cast<int>(values.size()), width * height);
    return Matrix(Size(width, height), values.begin());
}

std::vector<float> valuesOf(const Matrix& m) {
    return std::vector<float>(m.data(), m.data() + m.size().area());
}

void expectNear(const Matrix& actual, const Matrix& expected, float tolerance) {
    ASSERT_EQ(actual.size(), expected.size());
    for (int i = 0; i < expected.size().area(); ++i)
        EXPECT_NEAR(actual[i], expected[i], tolerance) << "at " << i;
}

std::string printed(const Matrix& m) {
    std::ostringstream stream;
    stream << m;
    return stream.str();
}

void expectCheck(const std::function<void()>& body, const std::string& expression, const std::string& tail) {
    const FailedCheck check = catchCheck(body);
    EXPECT_TRUE(check.thrown) << expression;
    EXPECT_EQ(check.expression, expression);
    EXPECT_EQ(check.tail, tail) << expression;
}

const char* const NO_MATRIX = "matrix doesn't exist";
const char* const OTHER_TARGET = "destination and source matrices should be different";

}  // namespace

TEST(MatrixBasics, constructionCopiesAndConversions) {
    const Matrix m = make(3, 2, {1, 2, 3, 4, 5, 6});
    Matrix copy(m);
    copy[0] = 100;
    EXPECT_EQ(m[0], 1.f);

    // points become columns; only the area counts on the way back, so a row converts too
    const Matrix column(PointF(1.5f, -2.f));
    EXPECT_EQ(column.size(), Size(1, 2));
    EXPECT_EQ(valuesOf(column), std::vector<float>({1.5f, -2.f}));
    EXPECT_EQ(static_cast<PointF>(make(2, 1, {3, 4})), PointF(3, 4));
    expectCheck([&] { static_cast<void>(static_cast<Point3dF>(column)); }, "size_.area() == 3",
                "matrix is assigned to point3dF only if it is 3-column or 3-row matrix");

    // the same size keeps the array and its contents; makeZero of it only clears
    Matrix kept = make(2, 2, {1, 2, 3, 4});
    const float* array = kept.data();
    kept.create(Size(2, 2));
    EXPECT_EQ(valuesOf(kept), std::vector<float>({1, 2, 3, 4}));
    kept.makeZero(Size(2, 2));
    EXPECT_EQ(kept.data(), array);
    EXPECT_EQ(valuesOf(kept), std::vector<float>(4, 0.f));
    expectCheck([&] { kept.create(kept); }, "this != &matrix", "");

    Matrix identity;
    identity.makeIdentity(3);
    identity(0, 2) = 5e-11f;
    EXPECT_TRUE(identity.isIdentity(3));
    EXPECT_FALSE(identity.isIdentity(2));
    identity(0, 2) = 1e-9f;
    EXPECT_FALSE(identity.isIdentity(3));
}

TEST(MatrixRows, rowOperationsDeletionAndTranspose) {
    // 11 columns: a vector body and a scalar tail
    const int width = 11;
    Matrix m(Size(width, 3));
    for (int r = 0; r < 3; ++r)
        for (int c = 0; c < width; ++c) m(r, c) = float(r * 100 + c);
    Matrix::addRow(m, 0, 2, 2.f);
    Matrix::swapRows(m, 0, 1);
    Matrix::multiplyRow(m, 1, -0.5f);
    for (int c = 0; c < width; ++c) {
        EXPECT_EQ(m(0, c), 100.f + c);
        EXPECT_EQ(m(1, c), -0.5f * c);
        EXPECT_EQ(m(2, c), 200.f + 3.f * c);
    }
    expectCheck([&] { Matrix::addRow(m, 3, 0, 1.f); }, "from >= 0 && from < (int)matrix.size().height",
                "invalid row index");

    Matrix rows = make(2, 5, {0, 1, 10, 11, 20, 21, 30, 31, 40, 41});
    const float* array = rows.data();
    rows.deleteRows(2, 2);
    EXPECT_EQ(rows.size(), Size(2, 4));
    EXPECT_EQ(rows.data(), array);
    EXPECT_EQ(valuesOf(rows), std::vector<float>({0, 1, 10, 11, 30, 31, 40, 41}));
    expectCheck([&] { rows.deleteRows(1, 0); }, "rowBegin <= rowEnd", "rowBegin > rowEnd");
    expectCheck([&] { rows.deleteRows(1, 4); }, "rowEnd < (int) size_.height", "");

    Matrix columns = make(5, 2, {0, 1, 2, 3, 4, 10, 11, 12, 13, 14});
    columns.deleteColumns(1, 2);
    EXPECT_EQ(valuesOf(columns), std::vector<float>({0, 3, 4, 10, 13, 14}));

    const Matrix t = make(3, 2, {1, 2, 3, 4, 5, 6}).transpose();
    EXPECT_EQ(valuesOf(t), std::vector<float>({1, 4, 2, 5, 3, 6}));
    expectCheck([] { Matrix().transpose(); }, "!isEmpty()", NO_MATRIX);
}

TEST(MatrixInvert, pivotRulesTwoByTwoPathAndSingularInput) {
    // The first row above 1e-5 is the pivot. With 2e-5 on top the elimination leaves
    // -s / 2e-5 for the second pivot and succeeds, though the row below holds a 1; a
    // largest-pivot search would have left s = 1e-6 there and given up.
    const float s = 1e-6f;
    const Matrix small = make(3, 3, {2e-5f, s, 0, 1, 0, 0, 0, 0, 1});
    Matrix inverse;
    ASSERT_TRUE(Matrix::invert(small, inverse));
    // the exact inverse is (0 1 0; 1/s -2e-5/s 0; 0 0 1)
    expectNear(inverse, make(3, 3, {0, 1, 0, 1.f / s, -20, 0, 0, 0, 1}), 1.f);

    // 1e-5 exactly is no pivot: the 1 below is taken and then nothing is left for column 1
    const Matrix atThreshold = make(3, 3, {1e-5f, s, 0, 1, 0, 0, 0, 0, 1});
    inverse = make(3, 3, {9, 9, 9, 9, 9, 9, 9, 9, 9});
    EXPECT_FALSE(Matrix::invert(atThreshold, inverse));
    EXPECT_EQ(valuesOf(inverse), std::vector<float>(9, 0.f));

    // the 2 x 2 closed form tests the determinant against the same threshold
    EXPECT_TRUE(Matrix::invert(make(2, 2, {4, 7, 2, 6}), inverse));
    expectNear(inverse, make(2, 2, {0.6f, -0.7f, -0.2f, 0.4f}), 1e-6f);
    const Matrix tinyDeterminant = make(2, 2, {1e-3f, 0, 0, 1e-3f});
    EXPECT_FALSE(Matrix::invert(tinyDeterminant, inverse));
    EXPECT_EQ(valuesOf(inverse), std::vector<float>(4, 0.f));
    // the same scale in the general path passes, its pivots being 1e-3
    ASSERT_TRUE(Matrix::invert(make(3, 3, {1e-3f, 0, 0, 0, 1e-3f, 0, 0, 0, 1}), inverse));
    expectNear(inverse, make(3, 3, {1000, 0, 0, 0, 1000, 0, 0, 0, 1}), 1e-2f);

    // singular: false and zero, also through the value form
    const Matrix singular = make(3, 3, {1, 2, 3, 2, 4, 6, 1, 0, 1});
    EXPECT_FALSE(Matrix::invert(singular, inverse));
    EXPECT_EQ(valuesOf(inverse), std::vector<float>(9, 0.f));
    EXPECT_EQ(valuesOf(singular.invert()), std::vector<float>(9, 0.f));

    // a general case, with a zero on the diagonal so that a row swap is needed, in place
    Matrix general = make(4, 4, {0, 2, 1, 3, 1, 1, 0, 2, 2, 0, 3, 1, 1, 4, 1, 0});
    const Matrix original(general);
    ASSERT_TRUE(Matrix::invert(general, general));
    expectNear(original * general, make(4, 4, {1, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1}), 1e-5f);
    const Matrix wide = make(3, 2, {1, 2, 3, 4, 5, 6});
    expectCheck([&] { wide.invert(); }, "inputMatrix.size().width == inputMatrix.size().height",
                "matrix is not square");
}

TEST(MatrixArithmetic, productsAndDeterminants) {
    const Matrix a = make(3, 2, {1, 2, 3, 4, 5, 6});
    const Matrix b = make(2, 3, {7, 8, 9, 10, 11, 12});
    const Matrix ab = a * b;
    EXPECT_EQ(valuesOf(ab), std::vector<float>({58, 64, 139, 154}));
    Matrix product(a);
    product *= b;
    EXPECT_EQ(valuesOf(product), valuesOf(ab));
    EXPECT_EQ(valuesOf(0.5f * a - a / 4.f), std::vector<float>({0.25f, 0.5f, 0.75f, 1, 1.25f, 1.5f}));

    Matrix result;
    Matrix::XTX(a, result);
    EXPECT_EQ(valuesOf(result), std::vector<float>({17, 22, 27, 22, 29, 36, 27, 36, 45}));
    Matrix::XXT(a, result);
    EXPECT_EQ(valuesOf(result), std::vector<float>({14, 32, 32, 77}));
    const Matrix weight = make(1, 3, {1, 2, 0});
    Matrix::XTXW(a, weight, result);
    EXPECT_EQ(valuesOf(result), std::vector<float>({9, 24, 24, 66}));

    EXPECT_FLOAT_EQ(make(2, 2, {4, 7, 2, 6}).determinant(), 10.f);
    EXPECT_FLOAT_EQ(make(3, 3, {2, -3, 1, 2, 0, -1, 1, 4, 5}).determinant(), 49.f);

    expectCheck([&] { a* a; }, "(matrix1.size().width) == (matrix2.size().height)",
                "the number of columns in A equals the number of rows in B equals m");
    Matrix target(a);
    expectCheck([&] { Matrix::multiply(target, b, target); },
                "&matrix1 != &matrixRes && &matrix2 != &matrixRes", OTHER_TARGET);
    expectCheck([&] { a + b; }, "matrix1.size() == matrix2.size()", "matrices of different sizes");
    expectCheck([&] { Matrix::XTXW(a, b, result); }, "weight.size().width == 1", "is is not column");
    expectCheck([] { Matrix(Size(4, 4)).determinant(); }, "0",
                "Not implemented for sizes except 2x2 and 3x3");
}

TEST(MatrixFixed, rotationsFrameAndPseudoInverse) {
    const float angle = 0.3f, c = std::cos(angle), s = std::sin(angle);
    // positive angles turn counter-clockwise
    expectNear(Matrix::rotationMatrix2d(angle) * Matrix(PointF(2, 0)), Matrix(PointF(2 * c, 2 * s)), 1e-6f);
    expectNear(Matrix::rotation3dX(angle) * Matrix(Point3dF(0, 1, 0)), Matrix(Point3dF(0, c, s)), 1e-6f);
    expectNear(Matrix::rotation3dZ(angle) * Matrix(Point3dF(1, 0, 0)), Matrix(Point3dF(c, s, 0)), 1e-6f);
    EXPECT_EQ(static_cast<PointF>(Matrix::mirrorOY() * Matrix(PointF(2, 3))), PointF(-2, 3));
    const Matrix frame = Matrix::transformToCS(Point3dF(1, 2, 3), Point3dF(4, 5, 6), Point3dF(7, 8, 9));
    EXPECT_EQ(static_cast<Point3dF>(frame * Matrix(Point3dF(0, 1, 0))), Point3dF(4, 5, 6));

    // full rank: the inverse; rank one: A^T / |A|^2; a zero first column
    expectNear(Matrix::pseudoInverse2x2(make(2, 2, {4, 7, 2, 6})), make(2, 2, {0.6f, -0.7f, -0.2f, 0.4f}),
               1e-6f);
    expectNear(Matrix::pseudoInverse2x2(make(2, 2, {1, 2, 2, 4})), make(2, 2, {1, 2, 2, 4}) / 25.f, 1e-6f);
    expectNear(Matrix::pseudoInverse2x2(make(2, 2, {0, 1, 0, 2})), make(2, 2, {0, 0, 0.2f, 0.4f}), 1e-6f);
}

TEST(MatrixText, saveLoadAndPrintFormsRoundTrip) {
    // the file form gives back the same floats, through a file as well
    const Matrix m = make(3, 2, {1.f / 3, -2.5e-7f, 12345.678f, 3.14159265f, 0, -1e30f});
    const std::string path = testing::TempDir() + "matrix_round_trip.txt";
    ASSERT_TRUE(m.save(path));
    Matrix back;
    ASSERT_TRUE(back.load(path));
    std::remove(path.c_str());
    EXPECT_EQ(valuesOf(back), valuesOf(m));
    std::istringstream noArea("0 4\n"), shortOfValues("2 2\n1 2 3");
    EXPECT_FALSE(back.load(noArea));
    EXPECT_FALSE(back.load(shortOfValues));

    const Matrix small = make(2, 2, {1.5f, -2, 1.f / 3, 4});
    EXPECT_EQ(printed(small), "Matrix(Size(2, 2)\n1.5\t-2\t\n0.3333333\t4\t\n)\n");
    std::istringstream text(printed(small) + printed(Matrix()) + "7");
    Matrix read, readEmpty = small;
    int after = 0;
    text >> read >> readEmpty >> after;
    expectNear(read, small, 1e-7f);
    EXPECT_TRUE(readEmpty.isEmpty());
    EXPECT_EQ(after, 7);

    expectCheck(
        [] {
            std::istringstream bad("Matrx(Size(1, 1)\n1\t\n)\n");
            Matrix m;
            bad >> m;
        },
        R"x((std::string("Matrix(") == buffer) && (std::istream&)(stream))x",
        "cannot read \"Matrix(\" from \"Matrx(S\"");
    const FailedCheck check = catchCheck([] {
        std::istringstream bad("Matrix(Size(1, 1)\n1\n)\n");
        Matrix m;
        bad >> m;
    });
    EXPECT_EQ(check.expression, R"x((std::string("\t\n)\n") == buffer) && (std::istream&)(stream))x");
}

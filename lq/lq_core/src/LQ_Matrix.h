#pragma once
// A small dense float matrix that owns its data, row-major: element (row r, column c)
// sits at r * width + c. Copies are deep; an empty matrix is 0 x 0 with no array.
//
// Sizes are BaseSize<int> with width = columns and height = rows, so a column vector of
// n values is Size(1, n).

#include <istream>
#include <ostream>
#include <string>

#include "LQ_Point.h"
#include "LQ_Size.h"

namespace LQ {

class Matrix {
public:
    Matrix() = default;
    // contents undefined; a size without area leaves the matrix empty
    explicit Matrix(const BaseSize<int>& size);
    Matrix(const BaseSize<int>& size, const float* data);
    Matrix(const Matrix& matrix);
    Matrix(Matrix&& matrix) noexcept;
    // a column: width 1, height 3
    explicit Matrix(const BasePoint3d<float>& point);
    // a column: width 1, height 2
    explicit Matrix(const BasePoint<float>& point);
    // 1 x 1
    explicit Matrix(float value);
    ~Matrix();

    Matrix& operator=(const Matrix& matrix);
    Matrix& operator=(Matrix&& matrix) noexcept;
    Matrix& operator=(const BasePoint3d<float>& point);
    Matrix& operator=(const BasePoint<float>& point);
    Matrix& operator=(float value);

    // Keeps the present array and its contents when the size is the same.
    void create(const BaseSize<int>& size);
    void create(const BaseSize<int>& size, const float* data);
    void create(const Matrix& matrix);
    void create(const BasePoint3d<float>& point);
    void create(const BasePoint<float>& point);
    void create(float value);
    void reset();

    void fill(float value);
    void zero();
    void makeZero(const BaseSize<int>& size);
    void makeZero(int n);
    void makeIdentity(int n);
    // n x n and every element within 1e-10 of the identity's
    bool isIdentity(int n) const;

    bool isEmpty() const { return data_ == nullptr; }
    const BaseSize<int>& size() const { return size_; }
    float* data() { return data_; }
    const float* data() const { return data_; }

    // flat row-major element
    float& operator[](int index) { return data_[index]; }
    const float& operator[](int index) const { return data_[index]; }
    float& operator()(int row, int column) { return data_[row * size_.width + column]; }
    const float& operator()(int row, int column) const { return data_[row * size_.width + column]; }

    // Only the area is tested, so a row converts as well as a column.
    operator BasePoint3d<float>() const;
    operator BasePoint<float>() const;

    Matrix transpose() const;

    // row `to` += factor * row `from`
    static void addRow(Matrix& matrix, int from, int to, float factor);
    static void swapRows(Matrix& matrix, int from, int to);
    static void multiplyRow(Matrix& matrix, int row, float factor);
    // Both ends included. Later rows (columns) move down in the same array; the
    // allocation stays.
    void deleteRows(int rowBegin, int rowEnd);
    void deleteColumns(int colBegin, int colEnd);

    // Gauss-Jordan elimination taking the first usable pivot of a column. A singular
    // input (a pivot not above 1e-5, or a 2 x 2 determinant below it) zeroes result and
    // returns false.
    static bool invert(const Matrix& inputMatrix, Matrix& result);
    // the inverse, or the zero matrix when there is none
    Matrix invert() const;

    // matrixRes = matrix1 * matrix2; matrixRes may be neither argument
    static void multiply(const Matrix& matrix1, const Matrix& matrix2, Matrix& matrixRes);
    Matrix& operator*=(const Matrix& matrix);
    Matrix& operator+=(const Matrix& matrix);
    Matrix& operator-=(const Matrix& matrix);
    Matrix& operator*=(float value);
    Matrix& operator/=(float value);

    // matrix1^T * matrix1, width x width
    static void XTX(const Matrix& matrix1, Matrix& matrixRes);
    // matrix1 * matrix1^T, height x height
    static void XXT(const Matrix& matrix1, Matrix& matrixRes);
    // (i, j) = sum over k of T(i, k) * T(j, k) * w(k); weight is a column of T's width
    static void XTXW(const Matrix& matrixTranspose, const Matrix& weight, Matrix& matrixRes);

    // 2 x 2 and 3 x 3 only
    float determinant() const;

    // rows (cos, -sin), (sin, cos)
    static Matrix rotationMatrix2d(float angle);
    // Moore-Penrose inverse of a 2 x 2 matrix by Greville's column update
    static Matrix pseudoInverse2x2(const Matrix& matrix);
    // rows (-1, 0), (0, 1)
    static Matrix mirrorOY();
    // u, v and w as the columns
    static Matrix transformToCS(const BasePoint3d<float>& u, const BasePoint3d<float>& v,
                                const BasePoint3d<float>& w);
    static Matrix rotation3dX(float angle);
    static Matrix rotation3dY(float angle);
    static Matrix rotation3dZ(float angle);

    // "width height\n", then each row's values each followed by a blank and the row by a
    // newline; written with enough digits to read back the same floats
    bool save(std::ostream& stream) const;
    bool save(const std::string& path) const;
    // false unless both dimensions are at least 1 and everything was read
    bool load(std::istream& stream);
    bool load(const std::string& path);

private:
    BaseSize<int> size_;
    float* data_ = nullptr;
};

Matrix operator+(const Matrix& matrix1, const Matrix& matrix2);
Matrix operator-(const Matrix& matrix1, const Matrix& matrix2);
Matrix operator*(const Matrix& matrix1, const Matrix& matrix2);
Matrix operator*(const Matrix& matrix, float value);
Matrix operator*(float value, const Matrix& matrix);
Matrix operator/(const Matrix& matrix, float value);

// "Matrix(Size(w, h)\n", each row's values each followed by a tab and the row by a
// newline, then ")\n"
std::ostream& operator<<(std::ostream& stream, const Matrix& matrix);
// Reads the form above back; a fixed piece that doesn't match fails the check.
std::istream& operator>>(std::istream& stream, Matrix& matrix);

}  // namespace LQ

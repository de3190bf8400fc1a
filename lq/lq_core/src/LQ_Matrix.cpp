#include "LQ_Matrix.h"

#include <cfloat>
#include <cmath>
#include <cstring>
#include <fstream>
#include <limits>
#include <utility>

#include "LQ_Stream.h"
#include "LQ_Utils.h"

namespace LQ {

namespace {

// Below this a pivot (or a 2 x 2 determinant) counts as zero.
constexpr float INVERT_EPSILON = 1e-5f;

// The mirrored products only compute the upper triangle.
void mirrorUpperTriangle(Matrix& matrix) {
    const int n = matrix.size().width;
    float* data = matrix.data();
    for (int i = 1; i < n; ++i)
        for (int j = 0; j < i; ++j) data[i * n + j] = data[j * n + i];
}

void assertSameSize(const Matrix& matrix1, const Matrix& matrix2) {
    LQ_ASSERT_MSG(!matrix1.isEmpty(), "matrix doesn't exist");
    LQ_ASSERT_MSG(!matrix2.isEmpty(), "matrix doesn't exist");
    LQ_ASSERT_MSG(matrix1.size() == matrix2.size(), "matrices of different sizes");
}

}  // namespace

// A macro so that the failed check names the piece of text that was expected.
#define LQ_MATRIX_READ_TEXT(stream, text)                                                              \
    do {                                                                                               \
        constexpr size_t MAX_BUFFER_SIZE = 256;                                                        \
        const size_t size = sizeof(text) - 1;                                                          \
        LQ_ASSERT_MSG(size < MAX_BUFFER_SIZE, "wrong str size " << size << " >= " << MAX_BUFFER_SIZE); \
        char buffer[MAX_BUFFER_SIZE] = {};                                                             \
        (stream).read(buffer, static_cast<std::streamsize>(size));                                     \
        LQ_ASSERT_MSG((std::string(text) == buffer) && (std::istream&)(stream),                        \
                      "cannot read \"" << (text) << "\" from \"" << buffer << "\"");                   \
    } while (0)

// ---- construction and assignment ----------------------------------------------------

Matrix::Matrix(const BaseSize<int>& size) {
    create(size);
}

Matrix::Matrix(const BaseSize<int>& size, const float* data) {
    create(size, data);
}

Matrix::Matrix(const Matrix& matrix) {
    create(matrix);
}

Matrix::Matrix(Matrix&& matrix) noexcept : size_(matrix.size_), data_(matrix.data_) {
    matrix.size_ = BaseSize<int>();
    matrix.data_ = nullptr;
}

Matrix::Matrix(const BasePoint3d<float>& point) {
    create(point);
}

Matrix::Matrix(const BasePoint<float>& point) {
    create(point);
}

Matrix::Matrix(float value) {
    create(value);
}

Matrix::~Matrix() {
    delete[] data_;
}

Matrix& Matrix::operator=(const Matrix& matrix) {
    if (this != &matrix) create(matrix);
    return *this;
}

Matrix& Matrix::operator=(Matrix&& matrix) noexcept {
    if (this != &matrix) {
        delete[] data_;
        size_ = matrix.size_;
        data_ = matrix.data_;
        matrix.size_ = BaseSize<int>();
        matrix.data_ = nullptr;
    }
    return *this;
}

Matrix& Matrix::operator=(const BasePoint3d<float>& point) {
    create(point);
    return *this;
}

Matrix& Matrix::operator=(const BasePoint<float>& point) {
    create(point);
    return *this;
}

Matrix& Matrix::operator=(float value) {
    create(value);
    return *this;
}

void Matrix::create(const BaseSize<int>& size) {
    LQ_ASSERT_MSG(size.width >= 0 && size.height >= 0, "negative matrix size " << size);
    if (size == size_ && data_) return;
    reset();
    if (size.area() == 0) return;
    data_ = new float[static_cast<size_t>(size.area())];
    size_ = size;
}

void Matrix::create(const BaseSize<int>& size, const float* data) {
    create(size);
    if (data_) std::memcpy(data_, data, sizeof(float) * static_cast<size_t>(size_.area()));
}

void Matrix::create(const Matrix& matrix) {
    LQ_ASSERT(this != &matrix);
    if (matrix.isEmpty()) {
        reset();
        return;
    }
    create(matrix.size_, matrix.data_);
}

void Matrix::create(const BasePoint3d<float>& point) {
    create(BaseSize<int>(1, 3));
    data_[0] = point.x;
    data_[1] = point.y;
    data_[2] = point.z;
}

void Matrix::create(const BasePoint<float>& point) {
    create(BaseSize<int>(1, 2));
    data_[0] = point.x;
    data_[1] = point.y;
}

void Matrix::create(float value) {
    create(BaseSize<int>(1, 1));
    data_[0] = value;
}

void Matrix::reset() {
    delete[] data_;
    data_ = nullptr;
    size_ = BaseSize<int>();
}

void Matrix::fill(float value) {
    const int area = size_.area();
    for (int i = 0; i < area; ++i) data_[i] = value;
}

void Matrix::zero() {
    fill(0.f);
}

void Matrix::makeZero(const BaseSize<int>& size) {
    create(size);
    zero();
}

void Matrix::makeZero(int n) {
    makeZero(BaseSize<int>(n, n));
}

void Matrix::makeIdentity(int n) {
    makeZero(n);
    for (int i = 0; i < n; ++i) data_[i * n + i] = 1.f;
}

bool Matrix::isIdentity(int n) const {
    if (size_ != BaseSize<int>(n, n)) return false;
    for (int r = 0; r < n; ++r)
        for (int c = 0; c < n; ++c)
            if (std::fabs(data_[r * n + c] - (r == c ? 1.0 : 0.0)) > 1e-10) return false;
    return true;
}

Matrix::operator BasePoint3d<float>() const {
    LQ_ASSERT_MSG(size_.area() == 3, "matrix is assigned to point3dF only if it is 3-column or 3-row matrix");
    return BasePoint3d<float>(data_[0], data_[1], data_[2]);
}

Matrix::operator BasePoint<float>() const {
    LQ_ASSERT_MSG(size_.area() == 2, "matrix is assigned to pointF only if it is 2-column or 2-row matrix");
    return BasePoint<float>(data_[0], data_[1]);
}

// ---- rows and columns ---------------------------------------------------------------

Matrix Matrix::transpose() const {
    LQ_ASSERT_MSG(!isEmpty(), "matrix doesn't exist");
    const int width = size_.width, height = size_.height;
    Matrix result(BaseSize<int>(height, width));
    for (int r = 0; r < height; ++r)
        for (int c = 0; c < width; ++c) result.data_[c * height + r] = data_[r * width + c];
    return result;
}

void Matrix::addRow(Matrix& matrix, int from, int to, float factor) {
    LQ_ASSERT_MSG(!matrix.isEmpty(), "matrix doesn't exist");
    LQ_ASSERT_MSG(from >= 0 && from < (int)matrix.size().height, "invalid row index");
    LQ_ASSERT_MSG(to >= 0 && to < (int)matrix.size().height, "invalid row index");
    const int width = matrix.size_.width;
    const float* source = matrix.data_ + from * width;
    float* target = matrix.data_ + to * width;
    for (int i = 0; i < width; ++i) target[i] += factor * source[i];
}

void Matrix::swapRows(Matrix& matrix, int from, int to) {
    LQ_ASSERT_MSG(!matrix.isEmpty(), "matrix doesn't exist");
    LQ_ASSERT_MSG(from >= 0 && from < (int)matrix.size().height, "invalid row index");
    LQ_ASSERT_MSG(to >= 0 && to < (int)matrix.size().height, "invalid row index");
    if (from == to) return;
    const int width = matrix.size_.width;
    float* a = matrix.data_ + from * width;
    float* b = matrix.data_ + to * width;
    for (int i = 0; i < width; ++i) {
        const float t = a[i];
        a[i] = b[i];
        b[i] = t;
    }
}

void Matrix::multiplyRow(Matrix& matrix, int row, float factor) {
    LQ_ASSERT_MSG(!matrix.isEmpty(), "matrix doesn't exist");
    LQ_ASSERT_MSG(row >= 0 && row < (int)matrix.size().height, "invalid row index");
    const int width = matrix.size_.width;
    float* target = matrix.data_ + row * width;
    for (int i = 0; i < width; ++i) target[i] *= factor;
}

void Matrix::deleteRows(int rowBegin, int rowEnd) {
    LQ_ASSERT_MSG(!isEmpty(), "matrix doesn't exist");
    LQ_ASSERT_MSG(rowBegin <= rowEnd, "rowBegin > rowEnd");
    LQ_ASSERT_MSG(rowBegin >= 0, "invalid row index");
    // the logged check text keeps this spelling
    // clang-format off
    LQ_ASSERT(rowEnd < (int) size_.height);
    // clang-format on
    const int width = size_.width;
    const int later = size_.height - rowEnd - 1;
    std::memmove(data_ + rowBegin * width, data_ + (rowEnd + 1) * width,
                 sizeof(float) * size_t(later * width));
    size_.height -= rowEnd - rowBegin + 1;
}

void Matrix::deleteColumns(int colBegin, int colEnd) {
    LQ_ASSERT_MSG(!isEmpty(), "matrix doesn't exist");
    LQ_ASSERT_MSG(colBegin <= colEnd, "colBegin > colEnd");
    LQ_ASSERT_MSG(colBegin >= 0, "invalid column index");
    LQ_ASSERT(colEnd < (int)size_.width);
    const int width = size_.width;
    const int removed = colEnd - colBegin + 1;
    const int kept = width - removed;
    // Every value moves to a lower index, so a forward copy never overwrites one still
    // to be read.
    for (int r = 0; r < size_.height; ++r) {
        const float* source = data_ + r * width;
        float* target = data_ + r * kept;
        for (int c = 0; c < colBegin; ++c) target[c] = source[c];
        for (int c = colEnd + 1; c < width; ++c) target[c - removed] = source[c];
    }
    size_.width = kept;
}

// ---- inverse ------------------------------------------------------------------------

bool Matrix::invert(const Matrix& inputMatrix, Matrix& result) {
    if (inputMatrix.isEmpty()) return false;
    if (&inputMatrix == &result) {
        const Matrix copy(inputMatrix);
        return invert(copy, result);
    }
    LQ_ASSERT_MSG(inputMatrix.size().width == inputMatrix.size().height, "matrix is not square");
    const int n = inputMatrix.size().width;
    result.create(inputMatrix.size());
    const float* in = inputMatrix.data_;

    if (n == 2) {
        const float det = in[0] * in[3] - in[1] * in[2];
        if (std::fabs(det) < INVERT_EPSILON) {
            result.zero();
            return false;
        }
        const float inverse = 1.f / det;
        result.data_[0] = in[3] * inverse;
        result.data_[1] = -in[1] * inverse;
        result.data_[2] = -in[2] * inverse;
        result.data_[3] = in[0] * inverse;
        return true;
    }

    // the input on the left, the identity on the right
    const int width = 2 * n;
    Matrix a;
    a.makeZero(BaseSize<int>(width, n));
    for (int r = 0; r < n; ++r) {
        std::memcpy(a.data_ + r * width, in + r * n, sizeof(float) * size_t(n));
        a.data_[r * width + n + r] = 1.f;
    }
    float* data = a.data_;

    // The first row above the threshold is the pivot, not the largest: results must not
    // change with the size of values lower down.
    for (int c = 0; c + 1 < n; ++c) {
        int pivot = c;
        while (pivot < n && !(std::fabs(data[pivot * width + c]) > INVERT_EPSILON)) ++pivot;
        if (pivot == n) {
            result.zero();
            return false;
        }
        if (pivot != c) swapRows(a, pivot, c);
        for (int row = c + 1; row < n; ++row) addRow(a, c, row, -data[row * width + c] / data[c * width + c]);
    }
    if (std::fabs(data[(n - 1) * width + n - 1]) < INVERT_EPSILON) {
        result.zero();
        return false;
    }
    for (int i = 0; i < n; ++i) multiplyRow(a, i, 1.f / data[i * width + i]);
    for (int i = 1; i < n; ++i)
        for (int j = 0; j < i; ++j) addRow(a, i, j, -data[j * width + i]);

    for (int r = 0; r < n; ++r)
        std::memcpy(result.data_ + r * n, data + r * width + n, sizeof(float) * size_t(n));
    return true;
}

Matrix Matrix::invert() const {
    Matrix result;
    invert(*this, result);
    return result;
}

// ---- products and element-wise arithmetic -------------------------------------------

void Matrix::multiply(const Matrix& matrix1, const Matrix& matrix2, Matrix& matrixRes) {
    LQ_ASSERT_MSG(!matrix1.isEmpty(), "matrix doesn't exist");
    LQ_ASSERT_MSG(!matrix2.isEmpty(), "matrix doesn't exist");
    LQ_ASSERT_MSG((matrix1.size().width) == (matrix2.size().height),
                  "the number of columns in A equals the number of rows in B equals m");
    LQ_ASSERT_MSG(&matrix1 != &matrixRes && &matrix2 != &matrixRes,
                  "destination and source matrices should be different");
    const int rows = matrix1.size_.height, inner = matrix1.size_.width, columns = matrix2.size_.width;
    matrixRes.makeZero(BaseSize<int>(columns, rows));
    // Row i of the result gathers the rows of matrix2 scaled by row i of matrix1, so the
    // inner loop runs along contiguous rows; each element still sums over k in order.
    for (int i = 0; i < rows; ++i) {
        float* target = matrixRes.data_ + i * columns;
        for (int k = 0; k < inner; ++k) {
            const float factor = matrix1.data_[i * inner + k];
            const float* source = matrix2.data_ + k * columns;
            for (int j = 0; j < columns; ++j) target[j] += factor * source[j];
        }
    }
}

Matrix& Matrix::operator*=(const Matrix& matrix) {
    Matrix product;
    multiply(*this, matrix, product);
    *this = std::move(product);
    return *this;
}

Matrix& Matrix::operator+=(const Matrix& matrix) {
    LQ_ASSERT_MSG(!isEmpty(), "matrix doesn't exist");
    LQ_ASSERT_MSG(!matrix.isEmpty(), "matrix doesn't exist");
    LQ_ASSERT_MSG(size() == matrix.size(), "matrices of different sizes");
    const int area = size_.area();
    const float* source = matrix.data_;
    for (int i = 0; i < area; ++i) data_[i] += source[i];
    return *this;
}

Matrix& Matrix::operator-=(const Matrix& matrix) {
    LQ_ASSERT_MSG(!isEmpty(), "matrix doesn't exist");
    LQ_ASSERT_MSG(!matrix.isEmpty(), "matrix doesn't exist");
    LQ_ASSERT_MSG(size() == matrix.size(), "matrices of different sizes");
    const int area = size_.area();
    const float* source = matrix.data_;
    for (int i = 0; i < area; ++i) data_[i] -= source[i];
    return *this;
}

Matrix& Matrix::operator*=(float value) {
    const int area = size_.area();
    for (int i = 0; i < area; ++i) data_[i] *= value;
    return *this;
}

Matrix& Matrix::operator/=(float value) {
    return *this *= 1.f / value;
}

Matrix operator+(const Matrix& matrix1, const Matrix& matrix2) {
    assertSameSize(matrix1, matrix2);
    Matrix result(matrix1.size());
    const int area = matrix1.size().area();
    const float* a = matrix1.data();
    const float* b = matrix2.data();
    float* target = result.data();
    for (int i = 0; i < area; ++i) target[i] = a[i] + b[i];
    return result;
}

Matrix operator-(const Matrix& matrix1, const Matrix& matrix2) {
    assertSameSize(matrix1, matrix2);
    Matrix result(matrix1.size());
    const int area = matrix1.size().area();
    const float* a = matrix1.data();
    const float* b = matrix2.data();
    float* target = result.data();
    for (int i = 0; i < area; ++i) target[i] = a[i] - b[i];
    return result;
}

Matrix operator*(const Matrix& matrix1, const Matrix& matrix2) {
    Matrix result;
    Matrix::multiply(matrix1, matrix2, result);
    return result;
}

Matrix operator*(const Matrix& matrix, float value) {
    Matrix result(matrix);
    result *= value;
    return result;
}

Matrix operator*(float value, const Matrix& matrix) {
    return matrix * value;
}

Matrix operator/(const Matrix& matrix, float value) {
    return matrix * (1.f / value);
}

void Matrix::XTX(const Matrix& matrix1, Matrix& matrixRes) {
    LQ_ASSERT_MSG(!matrix1.isEmpty(), "matrix doesn't exist");
    LQ_ASSERT_MSG(&matrix1 != &matrixRes, "destination and source matrices should be different");
    const int n = matrix1.size_.width, rows = matrix1.size_.height;
    matrixRes.makeZero(n);
    for (int k = 0; k < rows; ++k) {
        const float* row = matrix1.data_ + k * n;
        for (int i = 0; i < n; ++i) {
            const float factor = row[i];
            float* target = matrixRes.data_ + i * n;
            for (int j = i; j < n; ++j) target[j] += factor * row[j];
        }
    }
    mirrorUpperTriangle(matrixRes);
}

void Matrix::XXT(const Matrix& matrix1, Matrix& matrixRes) {
    LQ_ASSERT_MSG(!matrix1.isEmpty(), "matrix doesn't exist");
    LQ_ASSERT_MSG(&matrix1 != &matrixRes, "destination and source matrices should be different");
    const int n = matrix1.size_.height, width = matrix1.size_.width;
    matrixRes.create(BaseSize<int>(n, n));
    for (int i = 0; i < n; ++i) {
        const float* a = matrix1.data_ + i * width;
        for (int j = i; j < n; ++j) {
            const float* b = matrix1.data_ + j * width;
            float sum = 0.f;
            for (int k = 0; k < width; ++k) sum += a[k] * b[k];
            matrixRes.data_[i * n + j] = sum;
        }
    }
    mirrorUpperTriangle(matrixRes);
}

void Matrix::XTXW(const Matrix& matrixTranspose, const Matrix& weight, Matrix& matrixRes) {
    LQ_ASSERT_MSG(!matrixTranspose.isEmpty(), "matrix doesn't exist");
    LQ_ASSERT_MSG(&matrixTranspose != &matrixRes && &weight != &matrixRes,
                  "destination and source matrices should be different");
    LQ_ASSERT_MSG(matrixTranspose.size().width == weight.size().height,
                  "not accordance matrix and weight matrix");
    LQ_ASSERT_MSG(weight.size().width == 1, "is is not column");
    const int n = matrixTranspose.size_.height, width = matrixTranspose.size_.width;
    const float* w = weight.data_;
    matrixRes.create(BaseSize<int>(n, n));
    for (int i = 0; i < n; ++i) {
        const float* a = matrixTranspose.data_ + i * width;
        for (int j = i; j < n; ++j) {
            const float* b = matrixTranspose.data_ + j * width;
            float sum = 0.f;
            for (int k = 0; k < width; ++k) sum += a[k] * b[k] * w[k];
            matrixRes.data_[i * n + j] = sum;
        }
    }
    mirrorUpperTriangle(matrixRes);
}

float Matrix::determinant() const {
    LQ_ASSERT_MSG(!isEmpty(), "matrix doesn't exist");
    const float* m = data_;
    if (size_ == BaseSize<int>(2, 2)) return m[0] * m[3] - m[1] * m[2];
    if (size_ == BaseSize<int>(3, 3))
        return m[0] * (m[4] * m[8] - m[5] * m[7]) - m[1] * (m[3] * m[8] - m[5] * m[6]) +
               m[2] * (m[3] * m[7] - m[4] * m[6]);
    LQ_FAIL("Not implemented for sizes except 2x2 and 3x3");
    return 0.f;
}

// ---- fixed matrices -----------------------------------------------------------------

Matrix Matrix::rotationMatrix2d(float angle) {
    const float c = static_cast<float>(std::cos(static_cast<double>(angle)));
    const float s = static_cast<float>(std::sin(static_cast<double>(angle)));
    const float values[] = {c, -s, s, c};
    return Matrix(BaseSize<int>(2, 2), values);
}

Matrix Matrix::pseudoInverse2x2(const Matrix& matrix) {
    LQ_ASSERT_MSG(!matrix.isEmpty(), "matrix doesn't exist");
    LQ_ASSERT_MSG(matrix.size() == BaseSize<int>(2, 2), "matrix is not 2x2");
    const float* m = matrix.data_;
    // columns a1 = (m0, m2) and a2 = (m1, m3)
    const float a1x = m[0], a1y = m[2], a2x = m[1], a2y = m[3];

    // pseudo-inverse of the first column alone, a row
    const float n1 = a1x * a1x + a1y * a1y;
    float p1x = 0.f, p1y = 0.f;
    if (n1 > FLT_EPSILON) {
        p1x = a1x / n1;
        p1y = a1y / n1;
    }
    // the second column's part that the first one cannot explain
    const float d = p1x * a2x + p1y * a2y;
    const float cx = a2x - a1x * d, cy = a2y - a1y * d;
    const float nc = cx * cx + cy * cy;
    float bx, by;
    if (nc > FLT_EPSILON) {
        bx = cx / nc;
        by = cy / nc;
    } else {
        const float k = d / (1.f + d * d);
        bx = k * p1x;
        by = k * p1y;
    }
    const float values[] = {p1x - d * bx, p1y - d * by, bx, by};
    return Matrix(BaseSize<int>(2, 2), values);
}

Matrix Matrix::mirrorOY() {
    const float values[] = {-1.f, 0.f, 0.f, 1.f};
    return Matrix(BaseSize<int>(2, 2), values);
}

Matrix Matrix::transformToCS(const BasePoint3d<float>& u, const BasePoint3d<float>& v,
                             const BasePoint3d<float>& w) {
    const float values[] = {u.x, v.x, w.x, u.y, v.y, w.y, u.z, v.z, w.z};
    return Matrix(BaseSize<int>(3, 3), values);
}

Matrix Matrix::rotation3dX(float angle) {
    const float c = static_cast<float>(std::cos(static_cast<double>(angle)));
    const float s = static_cast<float>(std::sin(static_cast<double>(angle)));
    const float values[] = {1.f, 0.f, 0.f, 0.f, c, -s, 0.f, s, c};
    return Matrix(BaseSize<int>(3, 3), values);
}

Matrix Matrix::rotation3dY(float angle) {
    const float c = static_cast<float>(std::cos(static_cast<double>(angle)));
    const float s = static_cast<float>(std::sin(static_cast<double>(angle)));
    const float values[] = {c, 0.f, -s, 0.f, 1.f, 0.f, s, 0.f, c};
    return Matrix(BaseSize<int>(3, 3), values);
}

Matrix Matrix::rotation3dZ(float angle) {
    const float c = static_cast<float>(std::cos(static_cast<double>(angle)));
    const float s = static_cast<float>(std::sin(static_cast<double>(angle)));
    const float values[] = {c, -s, 0.f, s, c, 0.f, 0.f, 0.f, 1.f};
    return Matrix(BaseSize<int>(3, 3), values);
}

// ---- text forms ---------------------------------------------------------------------

bool Matrix::save(std::ostream& stream) const {
    const std::streamsize precision = stream.precision(std::numeric_limits<float>::max_digits10);
    stream << size_.width << ' ' << size_.height << '\n';
    for (int r = 0; r < size_.height; ++r) {
        for (int c = 0; c < size_.width; ++c) stream << data_[r * size_.width + c] << ' ';
        stream << '\n';
    }
    stream.precision(precision);
    return !stream.fail();
}

bool Matrix::save(const std::string& path) const {
    std::ofstream file(path);
    return save(file);
}

bool Matrix::load(std::istream& stream) {
    int width = 0, height = 0;
    stream >> width >> height;
    if (!stream || width < 1 || height < 1) return false;
    create(BaseSize<int>(width, height));
    const int area = size_.area();
    for (int i = 0; i < area; ++i) stream >> data_[i];
    return stream.good();
}

bool Matrix::load(const std::string& path) {
    std::ifstream file(path);
    return load(file);
}

std::ostream& operator<<(std::ostream& stream, const Matrix& matrix) {
    StreamO out(stream);
    out << "Matrix(" << matrix.size() << "\n";
    const int width = matrix.size().width;
    for (int r = 0; r < matrix.size().height; ++r) {
        for (int c = 0; c < width; ++c) out << matrix[r * width + c] << "\t";
        out << "\n";
    }
    out << ")\n";
    return stream;
}

std::istream& operator>>(std::istream& stream, Matrix& matrix) {
    LQ_MATRIX_READ_TEXT(stream, "Matrix(");
    BaseSize<int> matrixSize;
    stream >> matrixSize;
    matrix.create(matrixSize);
    const int area = matrix.size().area();
    for (int i = 0; i < area; ++i) stream >> matrix[i];
    // a matrix without elements has no tab before its last line
    if (area > 0)
        LQ_MATRIX_READ_TEXT(stream, "\t\n)\n");
    else
        LQ_MATRIX_READ_TEXT(stream, "\n)\n");
    return stream;
}

}  // namespace LQ

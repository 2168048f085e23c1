#include "Render/Drawable.h"

namespace vi {

namespace {

// transpose(inverse(A)) for the upper-left 3x3 A of `model`, as the cofactor
// matrix of A over its determinant; a singular A is not guarded against.
void deriveNormalMatrix(const glm::mat4& model, glm::mat3& normal) {
    // a(r, c): row r, column c (GLM indexes columns first)
    const float a00 = model[0][0], a01 = model[1][0], a02 = model[2][0];
    const float a10 = model[0][1], a11 = model[1][1], a12 = model[2][1];
    const float a20 = model[0][2], a21 = model[1][2], a22 = model[2][2];

    const float c00 = a11 * a22 - a12 * a21;
    const float c01 = a12 * a20 - a10 * a22;
    const float c02 = a10 * a21 - a11 * a20;
    const float c10 = a02 * a21 - a01 * a22;
    const float c11 = a00 * a22 - a02 * a20;
    const float c12 = a01 * a20 - a00 * a21;
    const float c20 = a01 * a12 - a02 * a11;
    const float c21 = a02 * a10 - a00 * a12;
    const float c22 = a00 * a11 - a01 * a10;

    const float inverseDeterminant = 1.0f / (a00 * c00 + a01 * c01 + a02 * c02);

    normal[0][0] = c00 * inverseDeterminant;
    normal[1][0] = c01 * inverseDeterminant;
    normal[2][0] = c02 * inverseDeterminant;
    normal[0][1] = c10 * inverseDeterminant;
    normal[1][1] = c11 * inverseDeterminant;
    normal[2][1] = c12 * inverseDeterminant;
    normal[0][2] = c20 * inverseDeterminant;
    normal[1][2] = c21 * inverseDeterminant;
    normal[2][2] = c22 * inverseDeterminant;
}

// view x model for affine transforms: the bottom rows of both are taken as
// (0, 0, 0, 1) and never read.
void deriveModelView(const glm::mat4& view, const glm::mat4& model, glm::mat4& modelView) {
    for (int column = 0; column < 4; ++column) {
        for (int row = 0; row < 3; ++row) {
            float sum = view[0][row] * model[column][0] + view[1][row] * model[column][1] +
                        view[2][row] * model[column][2];
            if (column == 3) sum += view[3][row];
            modelView[column][row] = sum;
        }
        modelView[column][3] = column == 3 ? 1.0f : 0.0f;
    }
}

// projection x model-view for a centred projection: only the diagonal, the
// third row's w term and the last column of the projection are read; its
// other elements (an off-centre frustum's skew among them) count as zero.
void deriveModelViewProjection(const glm::mat4& projection, const glm::mat4& modelView, glm::mat4& result) {
    const float p0 = projection[0][0];
    const float p5 = projection[1][1];
    const float p10 = projection[2][2];
    const float p11 = projection[2][3];
    const float p12 = projection[3][0];
    const float p13 = projection[3][1];
    const float p14 = projection[3][2];
    const float p15 = projection[3][3];
    for (int column = 0; column < 4; ++column) {
        const glm::vec4& v = modelView[column];
        result[column][0] = p0 * v[0] + p12 * v[3];
        result[column][1] = p5 * v[1] + p13 * v[3];
        result[column][2] = p10 * v[2] + p14 * v[3];
        result[column][3] = p11 * v[2] + p15 * v[3];
    }
}

}  // namespace

glm::mat4 Drawable::mProjectionMatrix(1.0f);
glm::mat4 Drawable::mViewMatrix(1.0f);
glm::mat4 Drawable::mIdentityMatrix(1.0f);

Drawable::Drawable()
    : mode(0),
      texture(nullptr),
      userWords{0, 0, 0},
      indices(nullptr),
      elementCount(0),
      vertexCount(0),
      userTag(0),
      positions(nullptr),
      normals(nullptr),
      texCoords(nullptr),
      modelMatrix(mIdentityMatrix),
      normalMatrix(0.0f),
      modelViewProjectionMatrix(0.0f),
      modelViewMatrix(0.0f),
      opacity(1.0f),
      positionsStatic(false),
      normalsStatic(false),
      texCoordsStatic(false),
      indicesChanged(false) {}

void Drawable::deriveMatrices() {
    deriveNormalMatrix(modelMatrix, normalMatrix);
    deriveModelView(mViewMatrix, modelMatrix, modelViewMatrix);
    deriveModelViewProjection(mProjectionMatrix, modelViewMatrix, modelViewProjectionMatrix);
}

}  // namespace vi

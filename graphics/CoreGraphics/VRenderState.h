#pragma once

#include <cstdint>

namespace CoreGraphics
{
  // Fixed-function state a draw needs. Modes are small numbers rather than GL enumerations so
  // that the records can be compared and stored without a context.
  struct VRenderState
  {
    // 0 none, 1 alpha, 2 additive alpha, 3 constant alpha additive, 4 premultiplied alpha.
    std::int32_t ColourBlendMode = 0;
    // 0 keeps the destination alpha, 1 adds, anything else writes the source alpha.
    std::int32_t AlphaBlendMode = 0;
    // 0 off, 1 front faces, anything else back faces.
    std::int32_t CullMode = 0;
    // 0 less, 1 less or equal, 2 greater, 3 greater or equal, 4 not equal, 5 equal.
    std::int32_t DepthFunction = 0;
    float BlendConstant = 1.0f;
    bool DepthTest = false;
    bool DepthWrite = false;
    bool RedWrite = true;
    bool GreenWrite = true;
    bool BlueWrite = true;
    bool AlphaWrite = true;
  };

  struct VTextureState
  {
    enum EMinificationFilter : std::int32_t
    {
      NearestMipmapNearest = 0,
      LinearMipmapNearest = 1,
      LinearMipmapLinear = 2,
      Nearest = 3,
    };

    std::int32_t MinificationFilter = LinearMipmapNearest;
    bool MagnificationLinear = true;
    bool ClampS = false;
    bool ClampT = false;
  };
} // namespace CoreGraphics

#include <CoreGraphics/ShaderResources.h>

// The registration functions live in the global namespace.
static void RegisterBasicShaders()
{
  Q_INIT_RESOURCE( BasicShaders );
}

static void RegisterSceneShaders()
{
  Q_INIT_RESOURCE( SceneShaders );
}

namespace CoreGraphics
{

void InitBasicShaderResources()
{
  RegisterBasicShaders();
}

void InitSceneShaderResources()
{
  RegisterSceneShaders();
}

} // namespace CoreGraphics

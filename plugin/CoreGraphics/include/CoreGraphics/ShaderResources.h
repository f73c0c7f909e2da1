#pragma once

namespace CoreGraphics
{

/// Make the built-in shader sources readable below ":/VertexShaders" and ":/FragmentShaders". May be called any
/// number of times. Thread: GUI, before the first `VResources::Prepare`.
void InitBasicShaderResources();
void InitSceneShaderResources();

} // namespace CoreGraphics

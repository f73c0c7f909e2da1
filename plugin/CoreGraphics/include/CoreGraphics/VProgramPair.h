#pragma once

#include <CoreGraphics/VShaderProgram.h>

#include <cstdint>
#include <memory>
#include <string>

namespace CoreGraphics
{

class VRenderContext;
class VResources;

/// What a render type holds for one look: the program of the visible mode, and that of the selection and
/// highlight modes, with the same vertex shader. A draw an object.
class VProgramPair
{
public:
  void Load( VResources& io_rResources, const std::string& i_rVertexName, const std::string& i_rFragmentName,
             const std::string& i_rSelectionName = "Selection" );

  /// Puts the program of the context's render mode in use. False: skip the draw.
  bool Use( VRenderContext& io_rContext );
  /// The program that `Use` last chose; null before.
  VShaderProgram* Current() const { return m_pCurrent; }
  /// Sets the id word of the next draw (see `SelectionColour`). Does nothing in the visible mode.
  void SetSelectionColour( std::uint32_t i_Word );
  void SetSelectionColour( const QVector3D& i_rColour );

  const std::shared_ptr< VShaderProgram >& Normal() const { return m_pNormal; }
  const std::shared_ptr< VShaderProgram >& Selection() const { return m_pSelection; }

private:
  std::shared_ptr< VShaderProgram > m_pNormal;
  std::shared_ptr< VShaderProgram > m_pSelection;
  VShaderProgram* m_pCurrent = nullptr;
  VUniform m_SelectionId{ "u_SelectionId" };
};

/// The same look drawn for many objects at once. The per-object uniforms of the vertex shader, and in the
/// selection and highlight modes `EAttributeInstanceFlags`, come from streams with a divisor (or, made for points,
/// from the vertices).
class VInstancedProgramPair
{
public:
  void Load( VResources& io_rResources, const std::string& i_rVertexName, const std::string& i_rFragmentName,
             const std::string& i_rSelectionName = "Selection" );
  /// For objects of one vertex each, drawn by `DrawArrays( GL_POINTS, … )`.
  void LoadPoints( VResources& io_rResources, const std::string& i_rVertexName, const std::string& i_rFragmentName,
                   const std::string& i_rSelectionName = "Selection" );

  /// Puts the program of the context's render mode in use. `i_FirstId` is the selection id of the first instance,
  /// the others follow; with 0 nothing is to be drawn in the selection and highlight modes. In the selection mode
  /// instances with `EInstanceHidden` vanish, in the highlight mode those neither selected nor preselected.
  /// False: skip the draw.
  bool Use( VRenderContext& io_rContext, std::uint32_t i_FirstId );
  VShaderProgram* Current() const { return m_pCurrent; }

  const std::shared_ptr< VShaderProgram >& Normal() const { return m_pNormal; }
  const std::shared_ptr< VShaderProgram >& Selection() const { return m_pSelection; }

private:
  std::shared_ptr< VShaderProgram > m_pNormal;
  std::shared_ptr< VShaderProgram > m_pSelection;
  VShaderProgram* m_pCurrent = nullptr;
  VUniform m_FirstId{ "u_FirstId" };
  VUniform m_RequiredFlags{ "u_RequiredFlags" };
  VUniform m_RefusedFlags{ "u_RefusedFlags" };
};

} // namespace CoreGraphics

#include <CoreGraphics/VProgramPair.h>

#include <CoreGraphics/SelectionColour.h>
#include <CoreGraphics/VRenderContext.h>
#include <CoreGraphics/VResources.h>

namespace CoreGraphics
{

void VProgramPair::Load( VResources& io_rResources, const std::string& i_rVertexName,
                         const std::string& i_rFragmentName, const std::string& i_rSelectionName )
{
  m_pNormal = io_rResources.GetProgram( i_rVertexName, i_rFragmentName );
  m_pSelection = io_rResources.GetProgram( i_rVertexName, i_rSelectionName );
  m_pCurrent = nullptr;
}

bool VProgramPair::Use( VRenderContext& io_rContext )
{
  const auto& rpProgram = io_rContext.RenderMode() == ERenderModeNormal ? m_pNormal : m_pSelection;
  m_pCurrent = rpProgram.get();
  return io_rContext.UseProgram( rpProgram );
}

void VProgramPair::SetSelectionColour( std::uint32_t i_Word )
{
  SetSelectionColour( CoreGraphics::SelectionColour( i_Word ) );
}

void VProgramPair::SetSelectionColour( const QVector3D& i_rColour )
{
  if ( m_pCurrent && m_pCurrent == m_pSelection.get() )
  {
    m_SelectionId.Set( *m_pCurrent, i_rColour );
  }
}

void VInstancedProgramPair::Load( VResources& io_rResources, const std::string& i_rVertexName,
                                  const std::string& i_rFragmentName, const std::string& i_rSelectionName )
{
  m_pNormal = io_rResources.GetProgram( i_rVertexName, i_rFragmentName, EFormInstanced );
  m_pSelection = io_rResources.GetProgram( i_rVertexName, i_rSelectionName, EFormInstancedSelection );
  m_pCurrent = nullptr;
}

void VInstancedProgramPair::LoadPoints( VResources& io_rResources, const std::string& i_rVertexName,
                                        const std::string& i_rFragmentName, const std::string& i_rSelectionName )
{
  m_pNormal = io_rResources.GetProgram( i_rVertexName, i_rFragmentName, EFormInstanced );
  m_pSelection = io_rResources.GetProgram( i_rVertexName, i_rSelectionName, EFormPointsSelection );
  m_pCurrent = nullptr;
}

bool VInstancedProgramPair::Use( VRenderContext& io_rContext, std::uint32_t i_FirstId )
{
  const int Mode = io_rContext.RenderMode();
  if ( Mode == ERenderModeNormal )
  {
    m_pCurrent = m_pNormal.get();
    return io_rContext.UseProgram( m_pNormal );
  }
  m_pCurrent = m_pSelection.get();
  if ( i_FirstId == 0 || !io_rContext.UseProgram( m_pSelection ) )
  {
    return false;
  }
  const bool bHighlight = Mode == ERenderModeHighlight;
  m_FirstId.Set( *m_pCurrent, int( i_FirstId & ESelectionIdMask ) );
  m_RequiredFlags.Set( *m_pCurrent, bHighlight ? EInstanceSelected | EInstancePreselected : 0 );
  m_RefusedFlags.Set( *m_pCurrent, bHighlight ? 0 : int( EInstanceHidden ) );
  return true;
}

} // namespace CoreGraphics

import QtQuick
import Flow2Graphics 1.0

Item {
    id: root

    // Looked up, for a handler in every tile would keep the pointer from the view below.
    readonly property Item hoveredTile: pointer.hovered ? tiles.childAt(sceneFBO.mousePos.x, sceneFBO.mousePos.y) : null

    // What lies under the pointer, and of a small tile what it has no room for.
    function tip() {
        const tile = hoveredTile && !hoveredTile.complete ? hoveredTile.summary : ""
        return [sceneFBO.toolTipText, tile].filter(text => text !== "").join("<br>")
    }

    SceneFramebufferObject {
        id: sceneFBO

        objectName: "sceneFBO"
        anchors.fill: parent
        clip: true
        focus: true
        scene: contextFlowScene
        cameraGrid: contextCameraGrid

        HoverHandler {
            id: pointer
        }

        Component.onCompleted: {
            const window = contextThemeWindow
            setOption("CameraView", true)
            setOption("3D", false)
            setOption("BackgroundColorRGB", (Math.round(window.r * 255) << 16)
                      | (Math.round(window.g * 255) << 8) | Math.round(window.b * 255))
        }
    }

    Item {
        id: tiles

        objectName: "tiles"
        anchors.fill: parent

        Repeater {
            model: contextCameraGrid

            CameraTile {
                loaderCompact: contextCameraGrid.count > 6
                hovered: root.hoveredTile === this
            }
        }
    }

    Text {
        objectName: "noCameras"
        anchors.centerIn: parent
        visible: contextCameraGrid !== null && contextCameraGrid.count === 0
        text: qsTr("No cameras")
        color: "#808489"
        font.pixelSize: 20
    }

    SceneContributions {
        anchors.right: parent.right
        anchors.bottom: parent.bottom
        anchors.margins: 16
        contributions: contextFlowScene ? contextFlowScene.contributions : null
        sceneItem: sceneFBO
        mostHeight: root.height / 2
        onCameraClicked: urn => contextFlowScene.SelectCamera(urn, false)
    }

    SceneToolTip {
        anchors.fill: parent
        text: root.tip()
        pointer: sceneFBO.mousePos
    }

    SceneNotice {
        anchors.horizontalCenter: parent.horizontalCenter
        anchors.bottom: parent.bottom
        anchors.bottomMargin: 24
        text: sceneFBO.notice
    }
}

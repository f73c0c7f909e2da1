import QtQuick
import Flow2Graphics 1.0

Item {
    id: root

    // Shown when the view cannot draw, or not as it should.
    component Notice: Rectangle {
        property alias text: label.text

        visible: label.text !== ""
        width: Math.min(label.implicitWidth, parent.width - 80) + 32
        height: label.height + 20
        radius: 5
        color: "#C0202020"
        border.color: "#E76500"

        Text {
            id: label

            anchors.centerIn: parent
            width: Math.min(implicitWidth, root.width - 80)
            wrapMode: Text.Wrap
            color: "#F0F0F0"
            font.pixelSize: 14
        }
    }

    SceneFramebufferObject {
        id: sceneFBO

        objectName: "sceneFBO"
        anchors.fill: parent
        clip: true
        focus: true
        scene: contextFlowScene
        cameraType: contextCameraType
        focusSelection: contextFocusSelection
        tracking: contextTracking

        Component.onCompleted: {
            const window = contextThemeWindow
            setOption("BackgroundColorRGB", (Math.round(window.r * 255) << 16)
                      | (Math.round(window.g * 255) << 8) | Math.round(window.b * 255))
        }
    }

    SceneToolTip {
        anchors.fill: parent
        text: sceneFBO.toolTipText
        pointer: sceneFBO.mousePos
    }

    Notice {
        anchors.horizontalCenter: parent.horizontalCenter
        anchors.bottom: parent.bottom
        anchors.bottomMargin: 24
        text: sceneFBO.notice
    }
}

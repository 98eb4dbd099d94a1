// The page's text, with the pictures in it as JPEG.
#include "Report.h"

#include "Output.h"

namespace kel_examples {

namespace {

const char* const kHead = R"(<!DOCTYPE html>
<html lang="en">
<meta charset="utf-8">
<meta name="viewport" content="width=device-width">
<title>Registration</title>
<style>
body { font: 16px/1.5 sans-serif; max-width: 72rem; margin: 2rem auto; padding: 0 1rem; background: #fff; color: #222 }
h1 { font-size: 1.5rem } h2 { font-size: 1.15rem; margin-top: 2rem }
table { border-collapse: collapse } td { padding: .15rem 1.2rem .15rem 0; vertical-align: top }
td:last-child, code { font-family: monospace; white-space: pre-wrap; overflow-wrap: anywhere }
img { max-width: 100%; display: block }
#both { position: relative; display: inline-block; touch-action: none; cursor: ew-resize }
#over { position: absolute; inset: 0; width: 100%; height: 100% }
#line { position: absolute; top: 0; bottom: 0; width: 2px; background: #f80; pointer-events: none }
#swipe { width: 100% }
</style>
)";

// The slider moves the border between the two pictures; blinking shows each for half a second.
const char* const kScript = R"(<script>
const over = document.getElementById('over'), line = document.getElementById('line');
const swipe = document.getElementById("swipe"), blink = document.getElementById("blink");
const both = document.getElementById("both");
let timer = 0;
function show(percent) {
  over.style.clipPath = 'inset(0 0 0 ' + percent + '%)';
  line.style.left = percent + '%';
}
function stop() { clearInterval(timer); timer = 0; blink.textContent = 'blink'; line.hidden = false; show(swipe.value); }
swipe.oninput = stop;
both.onpointermove = e => {
  if (timer || (e.pointerType !== 'mouse' && !e.buttons)) return;
  const box = both.getBoundingClientRect();
  swipe.value = 100 * (e.clientX - box.left) / box.width;
  show(swipe.value);
};
blink.onclick = () => {
  if (timer) return stop();
  let shown = false;
  line.hidden = true;
  blink.textContent = 'stop';
  timer = setInterval(() => { shown = !shown; over.style.clipPath = shown ? 'inset(0)' : 'inset(0 0 0 100%)'; }, 500);
};
show(50);
</script>
)";

std::string escaped(const std::string& text) {
    std::string result;
    for (const char c : text)
        if (c == '&')
            result += "&amp;";
        else if (c == '<')
            result += "&lt;";
        else if (c == '>')
            result += "&gt;";
        else if (c == '"')
            result += "&quot;";
        else
            result += c;
    return result;
}

std::string base64(const std::vector<uint8_t>& bytes) {
    static const char digits[] = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
    std::string text;
    text.reserve((bytes.size() + 2) / 3 * 4);
    for (size_t i = 0; i < bytes.size(); i += 3) {
        const size_t left = bytes.size() - i;
        const unsigned three = bytes[i] << 16 | (left > 1 ? bytes[i + 1] << 8 : 0) | (left > 2 ? bytes[i + 2] : 0);
        for (unsigned k = 0; k < 4; ++k)
            text += k <= left ? digits[three >> (18 - 6 * k) & 63] : '=';
    }
    return text;
}

std::string picture(const Image& image, const std::string& title, const std::string& attributes = "") {
    return "<img " + attributes + " alt=\"" + escaped(title) + "\" src=\"data:image/jpeg;base64," + base64(encodeJpeg(image)) +
           "\">\n";
}

} // namespace

void writeReport(const std::string& path, const Report& report) {
    std::string page = kHead;
    page += "<h1>" + escaped(report.verdict) + "</h1>\n<table>\n";
    for (const auto& [name, value] : report.facts)
        page += "<tr><td>" + escaped(name) + "</td><td>" + escaped(value) + "</td></tr>\n";
    page += "<tr><td>command</td><td>" + escaped(report.command) + "</td></tr>\n</table>\n";
    if (report.second && report.warped) {
        page += "<h2>The second picture, and the first one warped onto it</h2>\n"
                "<p>Move across the picture, or the slider; what belongs together does not jump.</p>\n<div id=\"both\">\n";
        page += picture(*report.second, "the second picture");
        page += picture(*report.warped, "the first picture, warped", "id=\"over\"");
        page += "<div id=\"line\"></div></div>\n"
                "<p><input id=\"swipe\" type=\"range\" min=\"0\" max=\"100\" step=\"0.1\" value=\"50\" aria-label=\"border\">"
                " <button id=\"blink\">blink</button></p>\n";
    }
    for (const auto& [title, image] : report.pictures)
        page += "<h2>" + escaped(title) + "</h2>\n" + picture(*image, title);
    if (report.second && report.warped)
        page += kScript;
    page += "</html>\n";
    Output file(path);
    file.write(page.data(), page.size());
    file.finish();
}

} // namespace kel_examples

"use strict";
// Shows the button, which is of no use without a script, and copies the JSON document.
(() => {
    const button = document.getElementById("copy");
    const status = document.getElementById("copied");
    button.hidden = false;
    button.addEventListener("click", async () => {
        const json = document.getElementById("json").textContent;
        try {
            await navigator.clipboard.writeText(json);
            status.textContent = "Copied.";
        } catch (error) {
            status.textContent = "The browser did not allow it.";
        }
    });
})();

// Lists the names of the reference that begin with what the guides are searched for. Doxygen's index has a file for each
// first letter: pairs of a key and [name, [address, is in this window, where it belongs], ...].
"use strict";
const wanted = (new URLSearchParams(location.search).get("q") || "").trim().toLowerCase();
const results = document.getElementById("reference-results"), list = document.createElement("ul");

function load(file, then) {
    const script = document.createElement("script");
    script.src = "reference/search/" + file;
    script.onload = then;
    document.body.append(script);
}

function show(name, address, owner) {
    const link = document.createElement("a");
    link.href = "reference/" + address.replace("../", "");
    link.textContent = name;
    const row = document.createElement("li");
    row.append(link, owner ? " of " + new DOMParser().parseFromString(owner, "text/html").body.textContent : "");
    list.append(row);
}

if (wanted) load("searchdata.js", () => {
    const letter = indexSectionsWithContent[0].indexOf(wanted[0]);
    if (letter >= 0) load("all_" + letter.toString(16) + ".js", () => {
        for (const [, [name, ...places]] of searchData)
            if (name.toLowerCase().startsWith(wanted)) for (const [address, , owner] of places) show(name, address, owner);
        results.after(list);
    });
});

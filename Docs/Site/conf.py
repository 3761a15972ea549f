# The site that ./check docs builds out of build/docs/source.
project = "DSPDll"
html_title = project
extensions = ["myst_parser"]
myst_heading_anchors = 3
html_theme = "furo"
html_static_path = ["static"]
html_css_files = ["site.css"]
html_copy_source = False
html_show_copyright = False
highlight_language = "none"
# README.md is read where it stands, too: its headings begin with the project's name.
suppress_warnings = ["myst.header"]

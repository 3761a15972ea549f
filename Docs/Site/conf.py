# The site that ./check docs builds out of build/docs/source.
project = "DSPDll"
html_title = project
extensions = ["myst_parser"]
myst_heading_anchors = 3
html_theme = "furo"
html_static_path = ["static"]
templates_path = ["templates"]
html_css_files = ["site.css"]
html_copy_source = False
html_show_copyright = False
highlight_language = "none"
# README.md is read where it stands, too: its headings begin with the project's name.
suppress_warnings = ["myst.header"]


# A page without headings has nothing to list beside it.
def hide_short_contents(app, pagename, templatename, context, doctree):
    if context.get("toc", "").count("<li>") < 2:
        context["furo_hide_toc"] = True


def setup(app):
    app.connect("html-page-context", hide_short_contents, priority=900)

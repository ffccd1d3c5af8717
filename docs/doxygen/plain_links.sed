# SPDX-License-Identifier: Apache-2.0
# Doxygen follows links to whole pages that it shows, not those into a page, to a folder or to a source.
s/(\]\([A-Za-z_/.]+\.md)#[^)]*\)/\1)/g
s/\[([^]]*)\]\((#[^)]*|(\.\.\/)*[^).:]*|(\.\.\/)?examples\/[^)]*)\)/\1/g

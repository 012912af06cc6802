"""``python -m renderlib``: the binding's command line."""

import sys

from renderlib.cli import main

sys.exit(main())
